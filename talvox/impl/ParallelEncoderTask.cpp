#include "talvox/impl/ParallelEncoderTask.h"

#include <exception>
#include <utility>

#include "pal/kd_log.h"
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
    encoded = false;
    try {
        if (isPresent(encoder) && isPresent(buffer)) {
            encoder->encode(*buffer);
        }
        encoded = true;
    } catch (const std::exception& exception) {
        kdLogFormatMessage("ParallelEncoder: a buffer could not be encoded: %s", exception.what());
    }
}

void ParallelEncoderTask::onTaskCompleted() {
    parent->taskDone(encoded);
}

}  // namespace Talvox
