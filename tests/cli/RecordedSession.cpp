#include "RecordedSession.h"

#include <cmath>
#include <filesystem>
#include <fstream>

#include "SoundFiles.h"
#include "tools/WavBytes.h"

namespace TestSupport {

namespace {

using Json = nlohmann::ordered_json;

const std::size_t BUFFER_SAMPLES = RecordedSession::RATE_HZ / 10;
const int DEVICE_DELAY_MS = 20;

void writeFile(const std::string& path, const std::string& bytes) {
    std::ofstream(path, std::ios::binary) << bytes;
}

}  // namespace

RecordedSession::RecordedSession()
    : session({{"format", 1},
               {"kit", "133"},
               {"time", "2026-11-22T05:10:57Z"},
               {"source", "a.wav"},
               {"sampleRate", RATE_HZ},
               {"hasSound", true},
               {"reachability", 1},
               {"engine", {{"vad", ""}}},
               {"recognizer", {{"language", "en-US"}}}}) {}

void RecordedSession::add(double ms, const std::string& kind, const Json& fields) {
    Json line = {{"t", std::llround(ms * 1e6)}, {"kind", kind}};
    if (fields.is_object()) {
        line.update(fields);
    }
    lines.push_back(line);
}

void RecordedSession::addEvent(double ms, const std::string& event, const Json& fields) {
    Json all = {{"n", lines.size()}, {"event", event}};
    if (fields.is_object()) {
        all.update(fields);
    }
    add(ms, "event", all);
}

void RecordedSession::addSound(const std::vector<int16_t>& samples) {
    for (std::size_t at = 0; at + BUFFER_SAMPLES <= samples.size(); at += BUFFER_SAMPLES) {
        const std::size_t offset = sound.size() * 2;
        sound.insert(sound.end(), samples.begin() + static_cast<std::ptrdiff_t>(at),
                     samples.begin() + static_cast<std::ptrdiff_t>(at + BUFFER_SAMPLES));
        add(static_cast<double>(sound.size()) * 1000 / RATE_HZ + DEVICE_DELAY_MS, "buffer",
            {{"n", offset / 2 / BUFFER_SAMPLES},
             {"offset", offset},
             {"bytes", 2 * BUFFER_SAMPLES},
             {"samples", BUFFER_SAMPLES}});
    }
}

void RecordedSession::write(const std::string& folder, bool hasSoundFile) const {
    std::filesystem::create_directories(folder);
    writeFile(folder + "/session.json",
              session.dump(-1, ' ', false, Json::error_handler_t::replace));
    writeFile(folder + "/events.jsonl", text());
    if (hasSoundFile) {
        writeFile(folder + "/sound.wav", Tools::makeWav(sound, RATE_HZ));
    }
}

std::string RecordedSession::text() const {
    std::string text;
    for (const Json& line : lines) {
        text += line.dump(-1, ' ', false, Json::error_handler_t::replace) + '\n';
    }
    return text;
}

RecordedSession makeStreamedSession() {
    RecordedSession made;
    made.add(0, "call", {{"call", "start"}});
    made.add(1, "started", {{"streaming", true}});
    made.add(2, "attempt", {{"attempt", 1}, {"streamed", true}, {"bytes", 0}});
    made.add(30, "connection",
             {{"attempt", 1}, {"new", true}, {"lookup", 5000000}, {"connected", 9000000}});
    std::vector<int16_t> samples(RecordedSession::RATE_HZ / 2);
    const std::vector<int16_t> voice = voiceLike(RecordedSession::RATE_HZ, 0.5);
    samples.insert(samples.end(), voice.begin(), voice.end());
    samples.resize(std::size_t{RecordedSession::RATE_HZ} * 2);
    made.addSound(samples);
    for (int buffer = 0; buffer < 20; ++buffer) {
        made.add(120 + 100 * buffer + 3, "encoded", {{"bytes", 3200}, {"last", false}});
        made.add(120 + 100 * buffer + 5, "sent", {{"attempt", 1}, {"bytes", 3206}});
    }
    made.addEvent(220, "recordingBegin");
    made.addEvent(820, "speakingBegin");
    made.add(820, "detector", {{"speech", true}, {"activity", 0.6}});
    made.add(2020, "detector", {{"speech", false}, {"activity", 0.1}});
    made.addEvent(2020, "recordingDone");
    made.add(2040, "encoded", {{"bytes", 0}, {"last", true}});
    made.add(2070, "sent", {{"attempt", 1}, {"bytes", 40}});
    made.add(2480, "head", {{"attempt", 1}, {"status", 200}});
    made.add(2490, "attemptEnd", {{"attempt", 1}, {"code", 200}, {"reason", ""}});
    made.add(2495, "finished", {{"code", 200}});
    made.addEvent(2500, "results",
                  {{"outcome", "accepted"},
                   {"hypotheses", Json::array({{{"text", "go"}, {"confidence", 0.8}}})}});
    made.add(2501, "end", {{"reason", "over"}, {"sound", 64000}});
    return made;
}

}  // namespace TestSupport
