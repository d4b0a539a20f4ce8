#include "VadReport.h"

#include <algorithm>
#include <filesystem>

#include "Report.h"
#include "cli/JsonEvents.h"
#include "cli/SoundInput.h"
#include "cli/Version.h"
#include "cli/corpus/Labels.h"
#include "cli/endpoint/VadText.h"
#include "talvox/VadParameters.h"

namespace Cli {

namespace {

Json labelsJson(const std::string& file, int64_t soundMs) {
    Json labels = Json::array();
    const std::string path = std::filesystem::path(file).replace_extension(".txt").string();
    if (file == STANDARD_INPUT || !std::filesystem::exists(path)) {
        return labels;
    }
    try {
        for (const Label& label : readLabels(path, soundMs)) {
            labels.push_back(
                {{"startMs", label.startMs}, {"endMs", label.endMs}, {"text", label.text}});
        }
    } catch (const LabelError&) {
        // Any text may stand beside a sound.
        return Json::array();
    }
    return labels;
}

Json thresholdJson(const std::string& vad, const std::string& name) {
    return parameterValue(vad, "engine") == "wrtc" ? Json(nullptr)
                                                   : Json(parameterNumber(vad, name));
}

bool hasOwnThresholds(const std::string& vad) {
    for (const char* name : {"individual", "total", "overhangmax1", "overhangmax2"}) {
        if (parameterValue(vad, name) != parameterValue("", name)) {
            return true;
        }
    }
    return false;
}

/** The row of thresholds that a level of the leading noise chooses; null below the first. */
Json noiseRowJson(double noiseLevelDb) {
    for (const Talvox::VadNoiseThresholds& row : Talvox::VadParameters::byNoise()) {
        if (noiseLevelDb >= row.noiseLevelDb) {
            return {{"fromLevel", row.noiseLevelDb},
                    {"individual", row.individual},
                    {"total", row.total},
                    {"overhangmax1", row.overhangMax1},
                    {"overhangmax2", row.overhangMax2}};
        }
    }
    return nullptr;
}

}  // namespace

void VadReport::printBuffer(const Talvox::VadBufferAnalysis& buffer) {
    lines_.printBuffer(buffer);
}

void VadReport::printSessionEvent(const SessionEvent& event) {
    lines_.printSessionEvent(event);
}

void VadReport::printSegments(const std::vector<Talvox::VadSegment>& segments, bool lastIsOpen) {
    lines_.printSegments(segments, lastIsOpen);
}

void VadReport::write(const std::string& path, const VadReportInput& input) const {
    const std::vector<int16_t>& samples = *input.samples;
    const auto lengthMs = static_cast<int64_t>(samples.size()) * 1000 / input.rateHz;
    Json data;
    data["report"] = "vad";
    data["version"] = versionText();
    data["file"] = input.file == STANDARD_INPUT ? "standard input" : input.file;
    data["vad"] = input.vad;
    data["rateHz"] = input.rateHz;
    data["lengthMs"] = lengthMs;
    data["activityOn"] = thresholdJson(input.vad, "activityon");
    data["activityOff"] = thresholdJson(input.vad, "activityoff");
    data["noiseLevel"] = nullptr;
    data["noiseRow"] = nullptr;
    data["hasOwnThresholds"] = hasOwnThresholds(input.vad);
    data["labels"] = labelsJson(input.file, lengthMs);
    data["wave"] = waveJson(samples, input.rateHz);
    data["audio"] = isPlayable(samples.size(), input.rateHz)
                        ? Json(wavAddress(samples, input.rateHz))
                        : Json(nullptr);
    for (const char* list : {"buffers", "events", "segments"}) {
        data[list] = Json::array();
    }
    std::istringstream lines(text_.str());
    for (std::string line; std::getline(lines, line);) {
        const Json object = Json::parse(line);
        if (object["event"] == "buffer") {
            if (object["learningNoise"].get<bool>()) {
                data["noiseLevel"] = object["level"];
            }
            data["buffers"].push_back(object);
        } else {
            data[object["event"] == "segment" ? "segments" : "events"].push_back(object);
        }
    }
    if (data["noiseLevel"].is_number() && !hasOwnThresholds(input.vad)) {
        data["noiseRow"] = noiseRowJson(data["noiseLevel"].get<double>());
    }
    writeReport(path, std::filesystem::path(input.file).filename().string(), data);
}

}  // namespace Cli
