/**
 * @file
 * When a failed exchange is tried again.
 */
#pragma once

#include <cstdint>

#include "core/Export.h"

namespace Network {

/** Decides about retries. Owned by the holder that was given it; called under the event lock. */
class KORVEL_CORE_API NetworkTaskRetryPolicy {
  public:
    virtual ~NetworkTaskRetryPolicy();

    /**
     * @param code     as for `NetworkTask::onFinished`
     * @param attempts how many attempts have been made, 1 or more
     * @return the pause before the next attempt in milliseconds on the platform clock, or -1 when
     *         the code is final
     */
    virtual int64_t getRetryDelayMs(int code, int attempts) const = 0;
};

/**
 * A fixed number of attempts with a fixed pause. Tried again is what another attempt can mend: no
 * response or a broken one, a time-out, and every status from 500 to 599. Any other status is
 * final, and so is a request that could not be made.
 */
class KORVEL_CORE_API NetworkTaskBasicRetryPolicy : public NetworkTaskRetryPolicy {
  public:
    /**
     * @param delayMs       pause between two attempts in milliseconds
     * @param attempts      the most attempts, the first one included; below 1 counts as 1
     * @param growingDelay  true: the pause doubles after every attempt
     */
    NetworkTaskBasicRetryPolicy(int delayMs, int attempts, bool growingDelay);

    int64_t getRetryDelayMs(int code, int attempts) const override;

  private:
    int delay;
    int maxAttempts;
    bool growing;
};

}  // namespace Network
