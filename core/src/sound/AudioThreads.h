#pragma once

#include <boost/shared_ptr.hpp>

#include "core/util/Singleton.h"
#include "sound/PulseCapture.h"

namespace Sound {

/** Runs captures, each on a thread of its own that nobody has to wait for. */
class AudioThreads : public Util::Singleton<AudioThreads> {
  public:
    /** What the system's list of threads calls them. */
    static constexpr const char* NAME = "talvox-audio";

    /**
     * Ends every capture that still runs and waits for their threads, but not longer than for a
     * moment: a thread may hang in its device, and touches nothing then that ever goes.
     */
    ~AudioThreads() override;

    /** @return false when the system gives no thread */
    bool start(const boost::shared_ptr<PulseCapture>& capture);
};

}  // namespace Sound
