#include "talvox/impl/ParallelEncoderTask.h"

#include <utility>

#include "talvox/impl/IsPresent.h"
#include "talvox/impl/ParallelEncoder.h"

namespace Talvox {

ParallelEncoderTask::ParallelEncoderTask(ParallelEncoder* owner,
                                         boost::shared_ptr<Sound::Encoder> target,
                                         boost::shared_ptr<const Sound::SoundDataBuffer> sound)
    : parent(owner), encoder(std::move(target)), buffer(std::move(sound)) {}

void ParallelEncoderTask::runTask() {
    if (isPresent(encoder) && isPresent(buffer)) {
        encoder->encode(*buffer);
    }
}

void ParallelEncoderTask::onTaskCompleted() {
    parent->taskDone();
}

}  // namespace Talvox
