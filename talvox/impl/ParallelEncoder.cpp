// The event thread writes buffers into the queue; one task at a time takes the first of them to a
// worker, where the encoder encodes it, and comes back to the event thread (`taskDone`), which
// hands on the output and starts the next. So the encoder is used by one thread at a time without a
// lock, and the order stays. After `closeWrite` the end of the last task finishes the stream.
//
// Whatever is called from here, the request, the callback, the failure callback, may destroy this
// object: such a call is the last thing that an operation does. The destructor cancels the task in
// flight, and under the event lock that is enough for its end never to arrive.
#include "talvox/impl/ParallelEncoder.h"

#include <array>
#include <boost/make_shared.hpp>
#include <utility>
#include <vector>

#include "core/tasking/TaskManager.h"
#include "core/util/EventLock.h"
#include "pal/kd.h"
#include "talvox/Log.h"
#include "talvox/impl/IsPresent.h"

namespace Talvox {

namespace {

const int LOG_LEVEL = 2;
const int TAKE_ALL = -1;

using TimeText = std::array<char, 10>;

/** The local time of day, for the log. */
TimeText timeOfDay() {
    const KDtime now = kdTime(nullptr);
    KDTm local = {};
    kdLocaltime_r(&now, &local);
    TimeText text = {};
    kdSprintf_s(text.data(), text.size(), "%02d:%02d:%02d", local.tm_hour, local.tm_min,
                local.tm_sec);
    return text;
}

/** @param position tells in the log where in the stream the bytes stand */
void writeOutput(RecognizeRequest& request, const Sound::SoundDataBuffer* output,
                 const char* position) {
    if (output == nullptr || output->getData().empty()) {
        return;
    }
    const std::vector<unsigned char>& bytes = output->getData();
    if (tvIsLogged(LOG_LEVEL)) {
        tvLogFormatMessage(LOG_LEVEL, "ParallelEncoder writes %s%d bytes at %s", position,
                           static_cast<int>(bytes.size()), timeOfDay().data());
    }
    request.write(bytes.data(), static_cast<unsigned>(bytes.size()));
}

}  // namespace

ParallelEncoder::ParallelEncoder(boost::shared_ptr<Sound::Encoder> target,
                                 boost::shared_ptr<RecognizeRequest> destination)
    : encoder(std::move(target)), request(std::move(destination)) {}

ParallelEncoder::ParallelEncoder(boost::shared_ptr<Sound::Encoder> target, Callback whenClosed)
    : encoder(std::move(target)), callback(std::move(whenClosed)) {}

ParallelEncoder::~ParallelEncoder() {
    const Util::EventLock lock;
    cancel();
}

void ParallelEncoder::write(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer) {
    if (failed) {
        return;
    }
    queue.push_back(buffer);
    wroteAny = true;
    if (observer) {
        observer->onEncoding();
    }
    taskQueueStep();
}

void ParallelEncoder::closeWrite() {
    closed = true;
    taskQueueStep();
}

void ParallelEncoder::cancel() {
    if (currentTask) {
        Tasking::TaskManager::getInstance().cancelTask(currentTask);
    }
}

void ParallelEncoder::taskDone(bool encoded) {
    if (!encoded || hasLostSound()) {
        giveUp();
        return;
    }
    boost::shared_ptr<Sound::SoundDataBuffer> output;
    if (request && isPresent(encoder)) {
        output = encoder->takeOutput(TAKE_ALL);
        writeOutput(*request, output.get(), "");
    }
    reportOutput(output.get(), false);
    currentTask->setBuffer(nullptr);
    spareTask = std::move(currentTask);
    taskQueueStep();
}

void ParallelEncoder::taskQueueStep() {
    if (currentTask) {
        return;
    }
    if (!queue.empty()) {
        startNextTask();
    } else if (closed) {
        finishStream();
    }
}

// The manager comes first: where a task is set, the destructor finds it and makes none.
void ParallelEncoder::startNextTask() {
    Tasking::TaskManager& tasks = Tasking::TaskManager::getInstance();
    currentTask =
        spareTask ? std::move(spareTask) : boost::make_shared<ParallelEncoderTask>(this, encoder);
    currentTask->setBuffer(queue.front());
    queue.pop_front();
    if (!tasks.addTask(currentTask, 0)) {
        giveUp();
    }
}

// What is called may destroy this.
void ParallelEncoder::giveUp() {
    kdLogFormatMessage("ParallelEncoder: sound could not be encoded");
    failed = true;
    queue.clear();
    currentTask.reset();
    if (onFailure) {
        const std::function<void()> target = std::move(onFailure);
        onFailure = nullptr;
        target();
    } else {
        taskQueueStep();
    }
}

void ParallelEncoder::finishStream() {
    boost::shared_ptr<Sound::SoundDataBuffer> output;
    if (failed) {
        output = boost::make_shared<Sound::SoundDataBuffer>(
            Sound::SoundDataInfo(Sound::SoundDataInfo::SPEEX, 1, 0, 2));
    } else if (isPresent(encoder)) {
        encoder->finish();
        if (wroteAny && hasLostSound()) {
            giveUp();
            return;
        }
        output = encoder->takeOutput(TAKE_ALL);
    }
    reportOutput(output.get(), true);
    if (request) {
        writeOutput(*request, output.get(), "the last ");
        request->close(true);
    } else {
        callBack(output);
    }
    tvLogFormatMessage(LOG_LEVEL, "ParallelEncoder closes");
}

void ParallelEncoder::reportOutput(const Sound::SoundDataBuffer* output, bool isLast) {
    if (observer) {
        observer->onEncoded(output != nullptr ? output->getData().size() : 0, isLast);
    }
}

void ParallelEncoder::callBack(const boost::shared_ptr<Sound::SoundDataBuffer>& output) {
    if (!KOR_ASSERT_AT(callback, "writer || callback", "talvox/impl/ParallelEncoder", 120)) {
        return;
    }
    int size = 0;
    if (isPresent(output)) {
        if (!wroteAny) {
            output->getData().clear();
        }
        size = static_cast<int>(output->getData().size());
    }
    tvLogFormatMessage(LOG_LEVEL, "ParallelEncoder calls back with %d bytes", size);
    const Callback target = callback;
    target(output);
}

}  // namespace Talvox
