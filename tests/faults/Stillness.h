/**
 * @file
 * The moment at which nothing moves any more between the library and a test's server.
 */
#pragma once

#include "support/ScriptedHttpServer.h"

namespace FaultTest {

/**
 * Waits until nothing happens unless the clock moves: the server has nothing to do, all that
 * either side sent has been taken by the other, and the network thread, the event thread and the
 * workers have done all that follows from it. So what the clock shows at each event depends on the
 * test only and not on the machine. The server must be the only one that the library talks to.
 *
 * @return false when that takes too long
 */
bool waitForStillness(const TestSupport::ScriptedHttpServer& server);

}  // namespace FaultTest
