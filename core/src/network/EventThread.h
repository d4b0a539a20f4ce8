#pragma once

#include <functional>

namespace Network {

/** Runs a function on the event thread under the event lock, after everything posted before. */
void postToEventThread(std::function<void()> function);

}  // namespace Network
