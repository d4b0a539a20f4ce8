#include "RecordingReport.h"

#include <algorithm>
#include <filesystem>

#include "Report.h"
#include "cli/JsonEvents.h"
#include "cli/Version.h"
#include "cli/recording/StageTable.h"
#include "core/util/Time.h"

namespace Cli {

namespace {

/** Lines of a kind that a page draws; a broken recording may have any number. */
const std::size_t MARKS_MAX = 5000;

/** To the microsecond, which keeps the page short. */
double msOf(int64_t ns) {
    const int64_t microseconds = ns / (Util::NS_PER_MS / 1000);
    return static_cast<double>(microseconds) / 1000;
}

double msOf(const Json& line, const char* name) {
    return msOf(numberOf(line, name));
}

/** A time of a connection; null for a stage that was not reached. */
Json stageEnd(const Json& line, const char* name) {
    return line.contains(name) ? Json(msOf(line, name)) : Json(nullptr);
}

/** What a page shows of an event behind its name. */
std::string describeEvent(const Json& line) {
    if (textOf(line, "event") == "error") {
        return textOf(line, "name") + ": " + textOf(line, "reason");
    }
    const auto list = line.find("hypotheses");
    if (list == line.end() || !list->is_array() || list->empty()) {
        return textOf(line, "outcome");
    }
    return textOf(line, "outcome") + ": " + textOf(list->front(), "text");
}

/** The lines of a recording, sorted into what a page draws. */
class Lanes {
  public:
    explicit Lanes(const Recording& recording) {
        for (const char* name : {"buffers", "encoded", "detector", "attempts", "happened"}) {
            data_[name] = Json::array();
        }
        for (const Json& line : recording.lines) {
            add(line);
        }
    }

    const Json& getData() const { return data_; }
    double getEndMs() const { return endMs_; }

  private:
    void add(const Json& line) {
        const std::string kind = textOf(line, "kind");
        const double ms = msOf(line, "t");
        endMs_ = std::max(endMs_, ms);
        if (kind == "buffer") {
            push(data_["buffers"], ms);
        } else if (kind == "encoded") {
            push(data_["encoded"], {{"ms", ms}, {"bytes", numberOf(line, "bytes")}});
        } else if (kind == "detector") {
            push(data_["detector"],
                 {{"ms", ms}, {"speech", line.value("speech", Json(false)) == Json(true)}});
        } else if (kind == "attempt") {
            push(data_["attempts"],
                 {{"ms", ms}, {"attempt", numberOf(line, "attempt")}, {"sent", Json::array()}});
        } else if (line.contains("attempt")) {
            addToAttempt(line, kind, ms);
        } else {
            addHappening(line, kind, ms);
        }
    }

    static void push(Json& list, const Json& value) {
        if (list.size() < MARKS_MAX) {
            list.push_back(value);
        }
    }

    void addToAttempt(const Json& line, const std::string& kind, double ms) {
        for (Json& attempt : data_["attempts"]) {
            if (attempt["attempt"] != numberOf(line, "attempt")) {
                continue;
            }
            if (kind == "sent") {
                push(attempt["sent"], {{"ms", ms}, {"bytes", numberOf(line, "bytes")}});
            } else if (kind == "head") {
                attempt["headMs"] = ms;
            } else if (kind == "attemptEnd") {
                attempt["endMs"] = ms;
                attempt["code"] = numberOf(line, "code");
                attempt["reason"] = textOf(line, "reason");
            } else if (kind == "connection") {
                attempt["readyMs"] = ms;
                attempt["isNew"] = line.value("new", Json(true)) == Json(true);
                attempt["lookup"] = stageEnd(line, "lookup");
                attempt["connected"] = stageEnd(line, "connected");
                attempt["tls"] = stageEnd(line, "tls");
            }
        }
    }

    void addHappening(const Json& line, const std::string& kind, double ms) {
        const std::string event = textOf(line, "event");
        if (kind == "event" && event != "buffer" && event != "power") {
            push(data_["happened"],
                 {{"ms", ms}, {"kind", "event"}, {"name", event}, {"text", describeEvent(line)}});
        } else if (kind == "call") {
            push(data_["happened"],
                 {{"ms", ms}, {"kind", "call"}, {"name", textOf(line, "call")}, {"text", ""}});
        } else if (kind == "recorderError" || kind == "finished") {
            push(data_["happened"],
                 {{"ms", ms},
                  {"kind", "engine"},
                  {"name", kind},
                  {"text", line.contains("code") ? std::to_string(numberOf(line, "code"))
                                                 : std::string()}});
        }
    }

    Json data_;
    double endMs_ = 0;
};

/** When the first sample was spoken, in ms since the session's start. */
double findSoundBegin(const Recording& recording) {
    for (const Json& line : recording.lines) {
        if (textOf(line, "kind") == "buffer") {
            const double samples = static_cast<double>(numberOf(line, "bytes")) / 2;
            return msOf(line, "t") - samples * 1000 / recording.sampleRateHz;
        }
    }
    return 0;
}

Json detailJson(const RecordingSummary& summary) {
    const Recording recording(summary.folder);
    const Lanes lanes(recording);
    Json detail = toJson(summary);
    detail["source"] = textOf(recording.session, "source");
    detail["kit"] = textOf(recording.session, "kit");
    detail["lanes"] = lanes.getData();
    detail["lengthMs"] = lanes.getEndMs();
    detail["wave"] = nullptr;
    detail["audio"] = nullptr;
    if (!recording.samples.empty()) {
        detail["soundBeginMs"] = findSoundBegin(recording);
        detail["wave"] = waveJson(recording.samples, recording.sampleRateHz);
        if (isPlayable(recording.samples.size(), recording.sampleRateHz)) {
            detail["audio"] = wavAddress(recording.samples, recording.sampleRateHz);
        }
    }
    return detail;
}

}  // namespace

void writeRecordingReport(const std::string& path, const std::vector<RecordingSummary>& summaries) {
    Json data = {{"report", "recording"}, {"version", versionText()}, {"stages", Json::array()}};
    for (const Stage& stage : STAGES) {
        data["stages"].push_back({{"name", stage.name}, {"title", stage.title}});
    }
    data["statistics"] = toJson(summarize(summaries));
    data["details"] = Json::array();
    if (summaries.size() == 1) {
        data["details"].push_back(detailJson(summaries[0]));
    } else {
        for (const std::size_t index : findSlowest(summaries, SLOWEST_COUNT)) {
            data["details"].push_back(detailJson(summaries[index]));
        }
    }
    const std::string title = summaries.size() == 1
                                  ? std::filesystem::path(summaries[0].folder).filename().string()
                                  : std::to_string(summaries.size()) + " recorded sessions";
    writeReport(path, title, data);
}

}  // namespace Cli
