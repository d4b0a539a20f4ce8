#include "Report.h"

#include <cerrno>
#include <cstring>
#include <fstream>

#include "Assets.h"
#include "cli/UsageError.h"
#include "core/util/Base64Coder.h"

namespace Cli {

namespace {

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

void appendNumber(std::string& bytes, uint32_t number, int count) {
    for (int index = 0; index < count; ++index) {
        bytes += static_cast<char>(number & 0xFFU);
        number >>= 8U;
    }
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
    const auto dataSize = static_cast<uint32_t>(samples.size() * 2);
    const auto rate = static_cast<uint32_t>(sampleRateHz);
    std::string bytes = "RIFF";
    appendNumber(bytes, 36 + dataSize, 4);
    bytes += "WAVEfmt ";
    appendNumber(bytes, 16, 4);
    appendNumber(bytes, 1, 2);
    appendNumber(bytes, 1, 2);
    appendNumber(bytes, rate, 4);
    appendNumber(bytes, rate * 2, 4);
    appendNumber(bytes, 2, 2);
    appendNumber(bytes, 16, 2);
    bytes += "data";
    appendNumber(bytes, dataSize, 4);
    for (const int16_t sample : samples) {
        appendNumber(bytes, static_cast<uint16_t>(sample), 2);
    }
    return "data:audio/wav;base64," + Util::Base64Coder::encode({bytes.begin(), bytes.end()});
}

}  // namespace Cli
