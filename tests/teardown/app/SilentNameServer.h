/**
 * @file
 * Names that are never found out.
 */
#pragma once

namespace TearDown {

/** Every question for this host hangs in the C library's `getaddrinfo`, until it is let go. */
extern const char* const SILENT_HOST;

/** Waits until `count` questions hang; false when that takes too long. */
bool waitForQuestions(int count);

/** Lets the questions that hang end, each without an answer. */
void answerQuestions();

}  // namespace TearDown
