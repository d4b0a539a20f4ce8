/**
 * @file
 * The preloaded library as the victim sees it.
 */
#pragma once

#include "Order.h"

namespace Torture {

/** Whether the library is preloaded. */
bool isPreloaded();

/** From now on calls count, and one fails. */
void arm(const Order& order, Report& report);

/** From now on no call fails. Copies what was counted into the report. */
void disarm(Report& report);

/** While it lives, calls of this thread belong to the test: they neither count nor fail. */
class Harness {
  public:
    Harness();
    ~Harness();
    Harness(const Harness&) = delete;
    Harness& operator=(const Harness&) = delete;
};

/** The opposite: inside the test, a call of the engine. */
class InEngine {
  public:
    InEngine();
    ~InEngine();
    InEngine(const InEngine&) = delete;
    InEngine& operator=(const InEngine&) = delete;
};

}  // namespace Torture
