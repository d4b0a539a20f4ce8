/**
 * @file
 * The encoding of one buffer.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "core/sound/Encoder.h"
#include "core/tasking/Task.h"

namespace Talvox {

class ParallelEncoder;

/**
 * Encodes one buffer on a worker thread and tells the parallel encoder on the event thread. Can be
 * run again, for the next buffer.
 */
class ParallelEncoderTask : public Tasking::Task {
  public:
    /** @param owner must cancel the task before it goes away */
    ParallelEncoderTask(ParallelEncoder* owner, boost::shared_ptr<Sound::Encoder> target);

    /** What the next run encodes; not while one is under way. */
    void setBuffer(boost::shared_ptr<const Sound::SoundDataBuffer> sound);

    void runTask() override;
    void onTaskCompleted() override;

  private:
    ParallelEncoder* parent;
    boost::shared_ptr<Sound::Encoder> encoder;
    boost::shared_ptr<const Sound::SoundDataBuffer> buffer;
    bool encoded = false;
};

}  // namespace Talvox
