#include "Report.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>

#include "Assets.h"
#include "cli/UsageError.h"
#include "core/util/Base64Coder.h"
#include "tools/WavBytes.h"

namespace Cli {

namespace {

const std::size_t WAVE_POINTS = 1500;
// A minute at 16 kHz makes 2.5 MB of page.
const std::size_t PLAYED_SECONDS_MAX = 60;

/** Text for an HTML element. */
std::string escaped(const std::string& text) {
    std::string result;
    for (const char character : text) {
        switch (character) {
            case '<':
                result += "&lt;";
                break;
            case '>':
                result += "&gt;";
                break;
            case '&':
                result += "&amp;";
                break;
            default:
                result += character;
        }
    }
    return result;
}

/** JSON for a script element, which no text in it may close. */
std::string dataText(const nlohmann::ordered_json& data) {
    std::string text = data.dump(-1, ' ', true, nlohmann::json::error_handler_t::replace);
    for (std::size_t at = text.find('<'); at != std::string::npos; at = text.find('<', at)) {
        text.replace(at, 1, "\\u003c");
    }
    return text;
}

}  // namespace

std::string reportPage(const std::string& title, const nlohmann::ordered_json& data) {
    std::string page = "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n";
    page += "<meta name=\"viewport\" content=\"width=device-width\">\n<title>";
    page += escaped(title);
    page += "</title>\n<link rel=\"icon\" href=\"data:,\">\n<style>\n";
    page += REPORT_CSS;
    page +=
        "</style>\n</head>\n<body>\n<main></main>\n<script type=\"application/json\" id=\"data\">";
    page += dataText(data);
    page += "</script>\n<script>\n";
    page += CHART_JS;
    page += "\n</script>\n<script>\n";
    page += RECORDING_JS;
    page += "</script>\n<script>\n";
    page += REPORT_JS;
    page += "</script>\n</body>\n</html>\n";
    return page;
}

void writeReport(const std::string& path, const std::string& title,
                 const nlohmann::ordered_json& data) {
    std::ofstream file(path, std::ios::binary);
    file << reportPage(title, data);
    if (!file.flush()) {
        throw UsageError("cannot write to " + path + ": " + std::strerror(errno));
    }
}

std::string wavAddress(const std::vector<int16_t>& samples, int sampleRateHz) {
    const std::string bytes = Tools::makeWav(samples, static_cast<unsigned>(sampleRateHz));
    return "data:audio/wav;base64," + Util::Base64Coder::encode({bytes.begin(), bytes.end()});
}

bool isPlayable(std::size_t samples, int sampleRateHz) {
    return samples <= PLAYED_SECONDS_MAX * static_cast<std::size_t>(sampleRateHz);
}

nlohmann::ordered_json waveJson(const std::vector<int16_t>& samples, int sampleRateHz) {
    const std::size_t piece = std::max<std::size_t>(1, samples.size() / WAVE_POINTS);
    nlohmann::ordered_json highest = nlohmann::ordered_json::array();
    nlohmann::ordered_json lowest = nlohmann::ordered_json::array();
    for (std::size_t begin = 0; begin < samples.size(); begin += piece) {
        const auto from = samples.begin() + static_cast<std::ptrdiff_t>(begin);
        const auto to =
            samples.begin() + static_cast<std::ptrdiff_t>(std::min(samples.size(), begin + piece));
        highest.push_back(*std::max_element(from, to));
        lowest.push_back(*std::min_element(from, to));
    }
    return {{"stepMs", static_cast<double>(piece) * 1000 / sampleRateHz},
            {"max", highest},
            {"min", lowest}};
}

}  // namespace Cli
