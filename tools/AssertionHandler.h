#pragma once

namespace Tools {

/**
 * Writes each broken invariant to standard error, one line marked as the program's. A debug build
 * then aborts, so that the fault is found where it happens; any other build goes on.
 * @param program the program's name; the text must outlive the process's last report
 */
void installAssertionHandler(const char* program);

}  // namespace Tools
