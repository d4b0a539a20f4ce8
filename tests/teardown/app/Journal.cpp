#include "Journal.h"

#include <cstdio>

namespace TearDown {

namespace {

const std::size_t TEXTS_MAX = 1000;

}  // namespace

std::atomic<bool>& Journal::gone() {
    static std::atomic<bool> isGone{false};
    return isGone;
}

void Journal::add(const std::string& text) {
    if (gone()) {
        std::printf("too late: %s\n", text.c_str());
        std::fflush(stdout);
        return;
    }
    const std::lock_guard<std::mutex> lock(mutex);
    if (texts.size() > TEXTS_MAX) {
        texts.clear();
    }
    texts.push_back(text);
}

void JournalListener::note(const char* text) {
    if (silent) {
        ++unexpected;
    }
    journal.add(text);
}

void JournalListener::onRecordingBegin(Talvox::Recognizer* /*recognizer*/) {
    note("recordingBegin");
}

void JournalListener::onSpeakingBegin(Talvox::Recognizer* /*recognizer*/) {
    note("speakingBegin");
}

void JournalListener::onRecordingDone(Talvox::Recognizer* /*recognizer*/) {
    note("recordingDone");
}

void JournalListener::onBufferReceived(Talvox::Recognizer* /*recognizer*/,
                                       const Sound::SoundDataBuffer& /*buffer*/) {
    note("buffer");
}

void JournalListener::onPowerChanged(Talvox::Recognizer* /*recognizer*/, float /*power*/) {
    note("power");
}

void JournalListener::onResults(Talvox::Recognizer* /*recognizer*/,
                                boost::shared_ptr<Talvox::Recognition> /*recognition*/) {
    note("results");
}

void JournalListener::onError(Talvox::Recognizer* /*recognizer*/, Talvox::SpeechError /*error*/) {
    note("error");
}

}  // namespace TearDown
