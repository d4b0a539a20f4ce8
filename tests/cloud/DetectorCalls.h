/**
 * @file
 * What the engine asks of the voice activity detector's library.
 */
#pragma once

#include <string>
#include <vector>

#include "libs/webrtc_vad.h"

namespace CloudTest {

/**
 * The calls since the last time this was called, in order: "force noise" when that is switched on,
 * and "individual N" for thresholds. The calls reach the library as well. Not locked: for sessions
 * on the test's own thread.
 */
std::vector<std::string> takeDetectorCalls();

}  // namespace CloudTest
