#include "talvox/SessionRecording.h"

#include <boost/make_shared.hpp>
#include <exception>
#include <mutex>

#include "pal/kd_assert.h"
#include "pal/kd_event.h"
#include "pal/kd_log.h"
#include "talvox/impl/recording/RecordingObserver.h"
#include "talvox/impl/recording/RecordingWriter.h"

namespace Talvox {

namespace {

struct State {
    std::mutex mutex;
    boost::shared_ptr<RecordingWriter> writer;
};

// Never destroyed: the writer's thread may run until the process has gone.
State& getState() {
    static auto* const state = new State;
    return *state;
}

bool install(const SessionRecordingOptions& options, State& state) {
    const auto writer = boost::make_shared<RecordingWriter>(options.folder, options.maxBytes);
    if (!writer->start()) {
        return false;
    }
    SessionObserver::setFactory([writer, options](const Recognizer& recognizer) {
        return boost::make_shared<RecordingObserver>(writer, options, recognizer);
    });
    state.writer = writer;
    return true;
}

void remove(State& state) {
    if (state.writer) {
        SessionObserver::setFactory({});
        state.writer->stop();
        state.writer.reset();
    }
}

}  // namespace

bool SessionRecording::start(const SessionRecordingOptions& options) {
    if (options.folder.empty() || options.maxBytes <= 0) {
        kdLogMessage("SessionRecording: it needs a folder and a bound above 0");
        return false;
    }
    State& state = getState();
    const std::lock_guard<std::mutex> lock(state.mutex);
    try {
        remove(state);
        return install(options, state);
    } catch (const std::exception& exception) {
        kdLogFormatMessage("SessionRecording: it cannot start: %s", exception.what());
        return false;
    }
}

void SessionRecording::stop() {
    State& state = getState();
    const std::lock_guard<std::mutex> lock(state.mutex);
    remove(state);
}

}  // namespace Talvox
