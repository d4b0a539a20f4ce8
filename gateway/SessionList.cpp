#include "gateway/SessionList.h"

#include <algorithm>
#include <nlohmann/json.hpp>

#include "core/util/Time.h"
#include "tools/WavBytes.h"

namespace Gateway {

namespace {

using Json = nlohmann::ordered_json;

std::string cut(const std::string& text) {
    return text.size() <= SessionList::MAX_TEXT_BYTES
               ? text
               : text.substr(0, SessionList::MAX_TEXT_BYTES) + "...";
}

RequestHead cut(const RequestHead& head) {
    return {cut(head.method),    cut(head.path),      cut(head.uuid),
            cut(head.sessionId), cut(head.soundType), cut(head.contentType)};
}

RequestSummary cut(RequestSummary summary) {
    for (std::string* text : {&summary.language, &summary.topic, &summary.soundType,
                              &summary.transcripts, &summary.refusal}) {
        *text = cut(*text);
    }
    return summary;
}

double toMs(KDust duration) {
    return static_cast<double>(duration) / Util::NS_PER_MS;
}

}  // namespace

SessionList::SessionList()
    : ownInstance(std::to_string(kdTime(nullptr)) + "-" + std::to_string(kdGetTimeUST())) {}

SessionList::Id SessionList::begin(const RequestHead& head) {
    Session session;
    session.begunAt = kdTime(nullptr);
    session.head = cut(head);
    const std::lock_guard<std::mutex> lock(mutex);
    if (sessions.size() == MAX_SESSIONS) {
        sessions.pop_front();
    }
    session.id = ++lastId;
    touch(session);
    sessions.push_back(std::move(session));
    return lastId;
}

void SessionList::addPiece(Id id, KDust sinceHead, std::size_t bytes) {
    const std::lock_guard<std::mutex> lock(mutex);
    Session* session = find(id);
    if (session == nullptr) {
        return;
    }
    const double ms = toMs(sinceHead);
    if (session->pieceCount > 0) {
        session->longestGapMs = std::max(session->longestGapMs, ms - session->lastMs);
    }
    if (session->pieces.size() < MAX_PIECES) {
        session->pieces.emplace_back(ms, bytes);
    }
    ++session->pieceCount;
    session->lastMs = ms;
    touch(*session);
}

void SessionList::addSound(Id id, const std::vector<int16_t>& samples) {
    const std::lock_guard<std::mutex> lock(mutex);
    Session* session = find(id);
    if (session == nullptr) {
        return;
    }
    const std::size_t count = std::min(samples.size(), MAX_SAMPLES - session->sound.size());
    session->sound.insert(session->sound.end(), samples.begin(),
                          samples.begin() + static_cast<std::ptrdiff_t>(count));
    session->soundSamples += samples.size();
    touch(*session);
}

void SessionList::update(Id id, const RequestSummary& summary) {
    const std::lock_guard<std::mutex> lock(mutex);
    Session* session = find(id);
    if (session != nullptr) {
        session->summary = cut(summary);
        touch(*session);
    }
}

void SessionList::end(Id id, unsigned status, const RequestSummary& summary, KDust answerTime) {
    const std::lock_guard<std::mutex> lock(mutex);
    Session* session = find(id);
    if (session != nullptr) {
        session->isRunning = false;
        session->status = status;
        session->answerMs = toMs(answerTime);
        session->summary = cut(summary);
        touch(*session);
    }
}

void SessionList::addRecord(const std::string& uuid, const std::string& record, unsigned status) {
    const std::lock_guard<std::mutex> lock(mutex);
    if (records.size() == MAX_RECORDS) {
        records.pop_front();
    }
    records.push_back({++version, kdTime(nullptr), cut(uuid), cut(record), status});
}

std::string SessionList::describeChanges(const std::string& instance, uint64_t after) const {
    const Json changes = collectChanges(instance == ownInstance ? after : 0);
    // Clients may send bytes that are not UTF-8, and a cut may split a character.
    return changes.dump(-1, ' ', true, Json::error_handler_t::replace);
}

Json SessionList::collectChanges(uint64_t known) const {
    const std::lock_guard<std::mutex> lock(mutex);
    Json changes = {{"instance", ownInstance},
                    {"version", version},
                    {"ids", Json::array()},
                    {"sessions", Json::array()},
                    {"records", Json::array()}};
    for (const Session& session : sessions) {
        changes["ids"].push_back(session.id);
        if (session.version > known) {
            changes["sessions"].push_back(toJson(session));
        }
    }
    for (const Record& record : records) {
        if (record.version > known) {
            changes["records"].push_back(toJson(record));
        }
    }
    return changes;
}

std::string SessionList::makeWav(Id id) const {
    const std::lock_guard<std::mutex> lock(mutex);
    for (const Session& session : sessions) {
        if (session.id == id && !session.sound.empty()) {
            return Tools::makeWav(session.sound, SpeechModel::RATE_HZ);
        }
    }
    return std::string();
}

SessionList::Session* SessionList::find(Id id) {
    for (Session& session : sessions) {
        if (session.id == id) {
            return &session;
        }
    }
    return nullptr;
}

Json SessionList::toJson(const Session& session) {
    Json pieces = Json::array();
    for (const auto& [ms, bytes] : session.pieces) {
        pieces.push_back({ms, bytes});
    }
    Json hypotheses = Json::array();
    for (const Hypothesis& hypothesis : session.summary.hypotheses) {
        hypotheses.push_back({{"text", hypothesis.text}, {"confidence", hypothesis.confidence}});
    }
    const RequestSummary& summary = session.summary;
    return {{"id", session.id},
            {"begunAt", session.begunAt},
            {"isStreamed", session.head.path == RecognitionRequest::STREAMING_PATH},
            {"isRunning", session.isRunning},
            {"status", session.status},
            {"uuid", session.head.uuid},
            {"sessionId", session.head.sessionId},
            {"requestId", summary.requestId},
            {"language", summary.language},
            {"topic", summary.topic},
            {"soundType", summary.soundType},
            {"transcripts", summary.transcripts},
            {"remark", summary.remark},
            {"refusal", summary.refusal},
            {"isCanceled", summary.isCanceled},
            {"bodyBytes", summary.bodyBytes},
            {"soundBytes", summary.soundBytes},
            {"soundMs", session.soundSamples * 1000 / SpeechModel::RATE_HZ},
            {"playableMs", session.sound.size() * 1000 / SpeechModel::RATE_HZ},
            {"decodeMs", summary.decodeMs},
            {"pieces", pieces},
            {"pieceCount", session.pieceCount},
            {"lastMs", session.lastMs},
            {"longestGapMs", session.longestGapMs},
            {"answerMs", session.answerMs},
            {"hypotheses", hypotheses}};
}

Json SessionList::toJson(const Record& record) {
    return {
        {"at", record.at}, {"uuid", record.uuid}, {"text", record.text}, {"status", record.status}};
}

}  // namespace Gateway
