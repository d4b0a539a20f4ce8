#include "ProbeText.h"

#include <algorithm>

#include "cli/Text.h"

namespace Cli {

namespace {

const std::size_t LINE_MAX_BYTES = 200;
const double MEGABYTE = 1024.0 * 1024.0;

/** With up to `decimals` digits behind the point, none of them a zero at the end. */
std::string shortest(double value, int decimals) {
    std::string text = fixed(value, 0, decimals);
    if (text.find('.') != std::string::npos) {
        text.erase(text.find_last_not_of('0') + 1);
        text.erase(text.find_last_not_of('.') + 1);
    }
    return text;
}

}  // namespace

std::string secondsText(double ms) {
    return shortest(ms / 1000, 1) + " s";
}

std::string msText(double ms) {
    return fixed(ms, 0, 0) + " ms";
}

std::string daysText(long days) {
    return std::to_string(days) + (days == 1 ? " day" : " days");
}

std::string megabytesText(std::size_t bytes) {
    return shortest(static_cast<double>(bytes) / MEGABYTE, 2) + " MB";
}

std::string firstLine(const std::string& body) {
    return printable(body.substr(0, std::min(body.find_first_of("\r\n"), LINE_MAX_BYTES)));
}

}  // namespace Cli
