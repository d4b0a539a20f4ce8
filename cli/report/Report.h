#pragma once

#include <cstddef>
#include <cstdint>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace Cli {

/**
 * The text of a report: one page that needs nothing else, neither files nor a network. The page's
 * script draws what the data's member "report" names ("vad", "score", "sweep" or
 * "recording").
 */
std::string reportPage(const std::string& title, const nlohmann::ordered_json& data);

/** Writes a report. @throws UsageError if the file cannot be written */
void writeReport(const std::string& path, const std::string& title,
                 const nlohmann::ordered_json& data);

/** Samples as the address of a WAV file, for a page's audio element. */
std::string wavAddress(const std::vector<int16_t>& samples, int sampleRateHz);

/** Whether a page may carry so much sound. */
bool isPlayable(std::size_t samples, int sampleRateHz);

/** The highest and lowest samples of equal pieces: "stepMs", "max", "min". */
nlohmann::ordered_json waveJson(const std::vector<int16_t>& samples, int sampleRateHz);

}  // namespace Cli
