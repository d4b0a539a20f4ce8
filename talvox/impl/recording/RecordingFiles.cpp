#include "talvox/impl/recording/RecordingFiles.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <limits>

#include "pal/kd_log.h"
#include "talvox/impl/recording/JsonObject.h"

namespace Talvox {

namespace {

using LogCollector::StoreFile;

constexpr int NEW_FILE = O_RDWR | O_CREAT | O_EXCL;
constexpr std::size_t WAV_HEAD_BYTES = 44;
constexpr std::size_t RIFF_SIZE_OFFSET = 4;
constexpr std::size_t DATA_SIZE_OFFSET = 40;
constexpr std::uint32_t RIFF_HEAD_BYTES = 36;
/** Stands in the header until the recording ends: readers take what the file holds. */
constexpr std::uint32_t UNKNOWN_SIZE = std::numeric_limits<std::uint32_t>::max();
/** What a full disk gets back, so that there is room for the last line. */
constexpr std::size_t SPARE_BYTES = 8192;

std::string littleEndian(std::uint32_t value, std::size_t size) {
    std::string bytes;
    for (std::size_t i = 0; i < size; ++i) {
        bytes += static_cast<char>(value >> (8 * i) & 0xFFU);
    }
    return bytes;
}

std::string makeWavHead(int sampleRate) {
    const auto rate = static_cast<std::uint32_t>(sampleRate);
    std::string head = "RIFF";
    head += littleEndian(UNKNOWN_SIZE, 4);
    head += "WAVEfmt ";
    head += littleEndian(16, 4);  // bytes of the format
    head += littleEndian(1, 2);   // PCM
    head += littleEndian(1, 2);   // channels
    head += littleEndian(rate, 4);
    head += littleEndian(rate * 2, 4);  // bytes per second
    head += littleEndian(2, 2);         // bytes per sample of all channels
    head += littleEndian(16, 2);        // bits
    head += "data";
    head += littleEndian(UNKNOWN_SIZE, 4);
    return head;
}

}  // namespace

bool RecordingFiles::open(const std::string& folder, std::string_view description) {
    const StoreFile session(folder + "/session.json", NEW_FILE);
    descriptionSize = description.size();
    bool works = session.isOpen() && session.write(description, 0);
    if (works && sampleRate > 0) {
        sound.emplace(folder + "/sound.wav", NEW_FILE);
        works = sound->isOpen() && sound->write(makeWavHead(sampleRate), 0);
    }
    if (works) {
        events.emplace(folder + "/events.jsonl", NEW_FILE);
        works = events->isOpen();
    }
    if (!works) {
        kdLogFormatMessage("SessionRecording: nothing can be recorded in %s: %s", folder.c_str(),
                           std::strerror(errno));
        broken = true;
        events.reset();
        sound.reset();
    }
    return works;
}

int64_t RecordingFiles::soundSize() const {
    return sound ? static_cast<int64_t>(WAV_HEAD_BYTES + soundBytes) : 0;
}

bool RecordingFiles::appendEvents(std::string_view lines) {
    if (!events->write(lines, eventsSize)) {
        const int reason = errno;
        events->truncate(eventsSize);
        errno = reason;
        return false;
    }
    eventsSize += lines.size();
    return true;
}

bool RecordingFiles::writeLines(std::string_view lines) {
    if (isOpen() && !appendEvents(lines)) {
        fail("an event");
    }
    return isOpen();
}

bool RecordingFiles::writeSound(std::string_view bytes) {
    if (!isOpen() || !sound) {
        return isOpen();
    }
    if (!sound->write(bytes, WAV_HEAD_BYTES + soundBytes)) {
        fail("sound");
        return false;
    }
    soundBytes += bytes.size();
    return true;
}

void RecordingFiles::fail(const char* what) {
    broken = true;
    const std::string reason = std::strerror(errno);
    kdLogFormatMessage("SessionRecording: %s could not be written, the recording ends: %s", what,
                       reason.c_str());
    if (sound) {
        soundBytes -= std::min(soundBytes, SPARE_BYTES);
        sound->truncate(WAV_HEAD_BYTES + soundBytes);
    }
    close("disk: " + reason, -1);
}

void RecordingFiles::close(std::string_view reason, int64_t time) {
    if (!isOpen()) {
        return;
    }
    JsonObject last;
    if (time >= 0) {
        last.add("t", time);
    }
    last.addText("kind", "end").addText("reason", reason);
    last.add("sound", static_cast<int64_t>(soundBytes));
    if (!appendEvents(last.getText() + "\n")) {
        kdLogMessage("SessionRecording: there is no room for the last line of a recording");
    }
    finishSound();
    events.reset();
}

void RecordingFiles::finishSound() {
    if (sound) {
        const auto most = static_cast<std::size_t>(UNKNOWN_SIZE - RIFF_HEAD_BYTES);
        const auto size = static_cast<std::uint32_t>(std::min(soundBytes, most));
        sound->write(littleEndian(size + RIFF_HEAD_BYTES, 4), RIFF_SIZE_OFFSET);
        sound->write(littleEndian(size, 4), DATA_SIZE_OFFSET);
        sound.reset();
    }
}

}  // namespace Talvox
