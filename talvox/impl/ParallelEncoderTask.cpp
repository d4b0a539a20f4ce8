#include "talvox/impl/ParallelEncoderTask.h"

#include <utility>

#include "talvox/impl/IsPresent.h"
#include "talvox/impl/ParallelEncoder.h"

namespace Talvox {

ParallelEncoderTask::ParallelEncoderTask(ParallelEncoder* owner,
                                         boost::shared_ptr<Sound::Encoder> target)
    : parent(owner), encoder(std::move(target)) {}

void ParallelEncoderTask::setBuffer(boost::shared_ptr<const Sound::SoundDataBuffer> sound) {
    buffer = std::move(sound);
}

void ParallelEncoderTask::runTask() {
    if (isPresent(encoder) && isPresent(buffer)) {
        encoder->encode(*buffer);
    }
}

void ParallelEncoderTask::onTaskCompleted() {
    parent->taskDone();
}

}  // namespace Talvox
