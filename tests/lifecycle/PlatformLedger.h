/**
 * @file
 * What the libraries have asked of the platform layer and not given back.
 */
#pragma once

namespace Lifecycle {

/**
 * The counts of one moment. This program stands between the libraries and the platform layer: it
 * defines the functions that make and end timers, callbacks, background work and posts, counts, and
 * passes on.
 */
struct PlatformLedger {
    long timers = 0;
    long callbacks = 0;
    long works = 0; /**< queued, running, or run and not told yet */
    long posts = 0; /**< posted functions that have not returned */

    bool operator==(const PlatformLedger& other) const {
        return timers == other.timers && callbacks == other.callbacks && works == other.works &&
               posts == other.posts;
    }

    static PlatformLedger now();

    /**
     * Waits until nothing is posted and no background work is under way: the event thread and the
     * workers are idle then. Not with the event lock held.
     * @return false when that takes too long
     */
    static bool waitUntilIdle();
};

}  // namespace Lifecycle
