/**
 * @file
 * The process in which calls fail.
 */
#pragma once

namespace Torture {

/**
 * Serves orders: reads each from `input`, runs it in a process of its own, and writes a `Verdict`
 * and the output of that process to `output`. This process itself never uses the engine, so that
 * each point begins as a fresh application does.
 * @return the exit status of the program, when the orders are over
 */
int serveOrders(int input, int output);

}  // namespace Torture
