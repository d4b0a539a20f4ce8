#pragma once

#include <cstddef>
#include <cstdint>
#include <deque>
#include <mutex>
#include <nlohmann/json_fwd.hpp>
#include <string>
#include <utility>
#include <vector>

#include "gateway/RecognitionRequest.h"
#include "gateway/RequestSummary.h"
#include "pal/kd_time.h"

namespace Gateway {

/**
 * The last recognition requests and usage records, for the page. Its memory is bounded: the oldest
 * entries make room for new ones, and long sounds, texts and lists of pieces are cut.
 *
 * Each change gives the entry a new version, the highest of the list, so a reader that knows a
 * version gets only what changed after it. Any thread may call any method. An `Id` whose session
 * had to make room is accepted and ignored.
 */
class SessionList {
  public:
    using Id = uint64_t;

    static constexpr std::size_t MAX_SESSIONS = 20;
    static constexpr std::size_t MAX_RECORDS = 100;
    /** Pieces of a session whose times are kept; further ones are only counted. */
    static constexpr std::size_t MAX_PIECES = 1000;
    /** Samples of a session that can be played: 30 s. */
    static constexpr std::size_t MAX_SAMPLES = std::size_t{30} * SpeechModel::RATE_HZ;
    /** Bytes of a client's text. */
    static constexpr std::size_t MAX_TEXT_BYTES = 2000;

    SessionList();
    SessionList(const SessionList&) = delete;
    SessionList& operator=(const SessionList&) = delete;

    /** A request has begun. */
    Id begin(const RequestHead& head);

    /** A piece of the body has arrived. @param sinceHead time since the head, in nanoseconds */
    void addPiece(Id id, KDust sinceHead, std::size_t bytes);

    /** Adds sound that was decoded, at `SpeechModel::RATE_HZ`. */
    void addSound(Id id, const std::vector<int16_t>& samples);

    /** Replaces what is known of a running request. */
    void update(Id id, const RequestSummary& summary);

    /**
     * The request is over.
     * @param status     the answer's status; 0 if the client went away before it
     * @param answerTime from the last piece to the answer, in nanoseconds
     */
    void end(Id id, unsigned status, const RequestSummary& summary, KDust answerTime);

    /** A usage record has arrived. @param status the answer's status */
    void addRecord(const std::string& uuid, const std::string& record, unsigned status);

    /**
     * What changed after a version, as JSON with ASCII only: "instance", "version", "ids" (of all
     * sessions, oldest first), "sessions" and "records" (the changed ones).
     * @param instance the list that `after` belongs to; everything is new if it is not this one
     */
    std::string describeChanges(const std::string& instance, uint64_t after) const;

    /** A session's sound so far as a WAV file; empty if there is none. */
    std::string makeWav(Id id) const;

  private:
    struct Session {
        Id id = 0;
        uint64_t version = 0;
        int64_t begunAt = 0;
        bool isRunning = true;
        unsigned status = 0;
        double answerMs = 0;
        RequestHead head;
        RequestSummary summary;
        /** Milliseconds since the head, and bytes. */
        std::vector<std::pair<double, std::size_t>> pieces;
        std::size_t pieceCount = 0;
        double lastMs = 0;
        double longestGapMs = 0;
        std::vector<int16_t> sound;
        std::size_t soundSamples = 0;
    };
    struct Record {
        uint64_t version = 0;
        int64_t at = 0;
        std::string uuid;
        std::string text;
        unsigned status = 0;
    };

    Session* find(Id id);
    nlohmann::ordered_json collectChanges(uint64_t known) const;
    void touch(Session& session) { session.version = ++version; }
    static nlohmann::ordered_json toJson(const Session& session);
    static nlohmann::ordered_json toJson(const Record& record);

    const std::string ownInstance;
    mutable std::mutex mutex;
    uint64_t version = 0;
    Id lastId = 0;
    std::deque<Session> sessions;
    std::deque<Record> records;
};

}  // namespace Gateway
