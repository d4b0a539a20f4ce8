#include "core/network/NetworkTaskRetryPolicy.h"

#include <algorithm>

#include "core/network/NetworkTask.h"

namespace Network {

namespace {

constexpr int64_t LONGEST_DELAY_MS = int64_t{24} * 60 * 60 * 1000;

bool canBeMended(int code) {
    return code == NetworkTask::NO_RESPONSE || code == NetworkTask::TIMED_OUT ||
           (code >= 500 && code <= 599);
}

}  // namespace

NetworkTaskRetryPolicy::~NetworkTaskRetryPolicy() = default;

NetworkTaskBasicRetryPolicy::NetworkTaskBasicRetryPolicy(int delayMs, int attempts,
                                                         bool growingDelay)
    : delay(std::max(delayMs, 0)), maxAttempts(std::max(attempts, 1)), growing(growingDelay) {}

int64_t NetworkTaskBasicRetryPolicy::getRetryDelayMs(int code, int attempts) const {
    if (!canBeMended(code) || attempts >= maxAttempts) {
        return -1;
    }
    int64_t pause = delay;
    for (int attempt = 1; growing && attempt < attempts && pause < LONGEST_DELAY_MS; ++attempt) {
        pause *= 2;
    }
    return std::min(pause, LONGEST_DELAY_MS);
}

}  // namespace Network
