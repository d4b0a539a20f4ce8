#include "talvox/impl/ParallelEncoderTask.h"

#include <utility>

#include "talvox/impl/ParallelEncoder.h"

namespace Talvox {

ParallelEncoderTask::ParallelEncoderTask(ParallelEncoder* owner,
                                         boost::shared_ptr<Sound::Encoder> target,
                                         boost::shared_ptr<const Sound::SoundDataBuffer> sound)
    : parent(owner), encoder(std::move(target)), buffer(std::move(sound)) {}

void ParallelEncoderTask::runTask() {
    Sound::Encoder* const target = encoder.operator->();
    const Sound::SoundDataBuffer* const source = buffer.operator->();
    if (target != nullptr && source != nullptr) {
        target->encode(*source);
    }
}

void ParallelEncoderTask::onTaskCompleted() {
    parent->taskDone();
}

}  // namespace Talvox
