#include "talvox/impl/VadNumber.h"

#include <cstdlib>
#include <limits>

#include "util/impl/NumberText.h"

namespace Talvox {

namespace {

using Util::NumberText;

/** Reads not-a-number, which `NumberText` takes for no number. */
VadNumber<float> readNan(const std::string& text) {
    const std::size_t start = text.find_first_not_of(" \t\n\v\f\r+-");
    const std::string word = start != std::string::npos ? text.substr(start, 3) : std::string();
    const bool isNan = word.size() == 3 && (word[0] | 0x20) == 'n' && (word[1] | 0x20) == 'a' &&
                       (word[2] | 0x20) == 'n';
    return isNan ? VadNumber<float>{std::numeric_limits<float>::quiet_NaN(), true,
                                    start + 3 == text.size()}
                 : VadNumber<float>{};
}

}  // namespace

VadNumber<int> readIntParameter(const std::string& text) {
    char* end = nullptr;
    const long long value = std::strtoll(text.c_str(), &end, 10);
    return {static_cast<int>(value), end != text.c_str(), *end == '\0'};
}

VadNumber<float> readFloatParameter(const std::string& text) {
    const NumberText::Reading<float> reading = NumberText::readFloat(text);
    if (reading.status == NumberText::NOT_A_NUMBER) {
        return readNan(text);
    }
    const bool isInRange = reading.status == NumberText::NUMBER;
    return {isInRange ? reading.value : reading.value * std::numeric_limits<float>::infinity(),
            true, reading.end == text.size()};
}

}  // namespace Talvox
