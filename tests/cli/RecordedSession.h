/**
 * @file
 * Recordings of sessions, written as docs/RECORDING.md says.
 */
#pragma once

#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace TestSupport {

/** The folder of one recorded session, made line by line; its sound is at 16 kHz. */
class RecordedSession {
  public:
    static constexpr int RATE_HZ = 16000;

    RecordedSession();

    /** What session.json holds. */
    nlohmann::ordered_json session;

    /** Adds a line. @param ms since the start of the session */
    void add(double ms, const std::string& kind, const nlohmann::ordered_json& fields = {});

    /** Adds a call of listeners. */
    void addEvent(double ms, const std::string& event, const nlohmann::ordered_json& fields = {});

    /**
     * Adds sound that arrives in buffers of 100 ms, each 20 ms after its last sample, the first
     * sample at the start of the session.
     */
    void addSound(const std::vector<int16_t>& samples);

    /** Writes the folder. @param hasSoundFile false leaves sound.wav out */
    void write(const std::string& folder, bool hasSoundFile = true) const;

    /** All lines as events.jsonl holds them. */
    std::string text() const;

  private:
    std::vector<nlohmann::ordered_json> lines;
    std::vector<int16_t> sound;
};

/**
 * A streamed session with half a second of voice between silences of half a second and of a second.
 * Recording stops after 2,020 ms, the results come after 2,500 ms.
 */
RecordedSession makeStreamedSession();

}  // namespace TestSupport
