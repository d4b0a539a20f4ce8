#include "Grid.h"

#include <algorithm>
#include <cstdint>
#include <optional>

#include "cli/Text.h"
#include "cli/UsageError.h"

namespace Cli {

namespace {

const int DECIMALS = 6;
const int64_t UNIT = 1000000;
const std::size_t DIGITS_MAX = 9;

[[noreturn]] void refuse(const std::string& part, const std::string& reason) {
    throw UsageError("--grid " + printable(part) + ": " + reason);
}

std::vector<std::string> split(const std::string& text, char separator) {
    std::vector<std::string> parts;
    std::size_t begin = 0;
    for (;;) {
        const std::size_t end = text.find(separator, begin);
        parts.push_back(text.substr(begin, end - begin));
        if (end == std::string::npos) {
            return parts;
        }
        begin = end + 1;
    }
}

/** A decimal number of at most six decimals in millionths. */
std::optional<int64_t> parseDecimal(const std::string& text) {
    const bool isNegative = !text.empty() && text[0] == '-';
    int64_t number = 0;
    int decimals = -1;
    std::size_t digits = 0;
    for (std::size_t index = isNegative ? 1 : 0; index < text.size(); ++index) {
        if (text[index] == '.' && decimals < 0) {
            decimals = 0;
            continue;
        }
        if (text[index] < '0' || text[index] > '9' || ++digits > DIGITS_MAX + DECIMALS ||
            decimals == DECIMALS) {
            return std::nullopt;
        }
        number = number * 10 + (text[index] - '0');
        decimals += decimals >= 0 ? 1 : 0;
    }
    for (int place = std::max(0, decimals); place < DECIMALS; ++place) {
        number *= 10;
        if (number > UNIT * UNIT) {
            return std::nullopt;
        }
    }
    return digits > 0 ? std::optional(isNegative ? -number : number) : std::nullopt;
}

std::string decimalText(int64_t millionths) {
    std::string text = millionths < 0 ? "-" : "";
    const int64_t magnitude = millionths < 0 ? -millionths : millionths;
    text += std::to_string(magnitude / UNIT);
    std::string decimals = std::to_string(UNIT + magnitude % UNIT).substr(1);
    decimals.erase(decimals.find_last_not_of('0') + 1);
    return decimals.empty() ? text : text + '.' + decimals;
}

std::vector<std::string> parseRange(const std::string& part, const std::string& text) {
    std::vector<int64_t> numbers;
    for (const std::string& field : split(text, ':')) {
        const std::optional<int64_t> number = parseDecimal(field);
        if (!number) {
            refuse(part, "\"" + printable(field) + "\" is not a decimal number");
        }
        numbers.push_back(*number);
    }
    if (numbers.size() != 3 || numbers[2] <= 0 || numbers[1] < numbers[0]) {
        refuse(part, "a range is FIRST:LAST:STEP, with a step above 0");
    }
    if ((numbers[1] - numbers[0]) / numbers[2] >= static_cast<int64_t>(GRID_POINTS_MAX)) {
        refuse(part, "more than " + std::to_string(GRID_POINTS_MAX) + " values");
    }
    std::vector<std::string> values;
    for (int64_t number = numbers[0]; number <= numbers[1]; number += numbers[2]) {
        values.push_back(decimalText(number));
    }
    return values;
}

GridAxis parseAxis(const std::string& part) {
    const std::size_t equals = part.find('=');
    if (equals == 0 || equals == std::string::npos || equals + 1 == part.size()) {
        refuse(part, "expected NAME=FIRST:LAST:STEP or NAME=VALUE,VALUE");
    }
    GridAxis axis;
    axis.name = part.substr(0, equals);
    const std::string text = part.substr(equals + 1);
    axis.values = text.find(':') != std::string::npos ? parseRange(part, text) : split(text, ',');
    for (const std::string& value : axis.values) {
        if (value.empty()) {
            refuse(part, "a value is empty");
        }
    }
    return axis;
}

}  // namespace

std::vector<GridAxis> parseGrid(const std::string& text) {
    std::vector<GridAxis> axes;
    std::size_t points = 1;
    for (const std::string& part : split(text, ';')) {
        if (part.empty()) {
            continue;
        }
        axes.push_back(parseAxis(part));
        points *= axes.back().values.size();
        if (points > GRID_POINTS_MAX) {
            refuse(text, "more than " + std::to_string(GRID_POINTS_MAX) + " points");
        }
    }
    if (axes.empty()) {
        throw UsageError("--grid has no parameter");
    }
    return axes;
}

std::vector<std::string> gridPoints(const std::vector<GridAxis>& axes) {
    std::vector<std::string> points = {""};
    for (const GridAxis& axis : axes) {
        std::vector<std::string> longer;
        longer.reserve(points.size() * axis.values.size());
        for (const std::string& point : points) {
            for (const std::string& value : axis.values) {
                std::string text = point;
                text += point.empty() ? "" : ";";
                text += axis.name;
                text += '=';
                text += value;
                longer.push_back(std::move(text));
            }
        }
        points = std::move(longer);
    }
    return points;
}

}  // namespace Cli
