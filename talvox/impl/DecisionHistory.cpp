#include "talvox/impl/DecisionHistory.h"

#include <algorithm>
#include <bitset>

namespace {

constexpr std::size_t WORD_BITS = 64;
constexpr uint64_t ALL_BITS = ~uint64_t{0};

void assignBit(std::vector<uint64_t>& words, std::size_t position, bool value) {
    const uint64_t mask = uint64_t{1} << (position % WORD_BITS);
    uint64_t& word = words[position / WORD_BITS];
    word = value ? word | mask : word & ~mask;
}

}  // namespace

namespace Talvox {

void DecisionHistory::resize(std::size_t newLength) {
    if (newLength == length) {
        return;
    }
    std::vector<uint64_t> resized((newLength + WORD_BITS - 1) / WORD_BITS, 0);
    const std::size_t kept = std::min(length, newLength);
    for (std::size_t i = 0; i < kept; ++i) {
        assignBit(resized, i, at(i));
    }
    words.swap(resized);
    length = newLength;
    oldest = 0;
    decided = decided > 0 ? length : 0;
}

void DecisionHistory::push(bool decision) {
    if (length == 0) {
        return;
    }
    assignBit(words, oldest, decision);
    decided = std::min(decided + 1, length);
    oldest = oldest + 1 == length ? 0 : oldest + 1;
}

bool DecisionHistory::at(std::size_t index) const {
    const std::size_t behindOldest = length - oldest;
    const std::size_t position = index < behindOldest ? oldest + index : index - behindOldest;
    return (words[position / WORD_BITS] >> (position % WORD_BITS) & 1) != 0;
}

std::size_t DecisionHistory::countNewest(std::size_t count) const {
    const std::size_t span = std::min(count, decided);
    // The newest decision stands before the oldest one, in a circle.
    if (span <= oldest) {
        return countStored(oldest - span, oldest);
    }
    return countStored(0, oldest) + countStored(length - (span - oldest), length);
}

std::size_t DecisionHistory::countStored(std::size_t begin, std::size_t end) const {
    if (begin == end) {
        return 0;
    }
    const std::size_t first = begin / WORD_BITS;
    const std::size_t last = (end - 1) / WORD_BITS;
    std::size_t ones = 0;
    for (std::size_t i = first; i <= last; ++i) {
        uint64_t word = words[i];
        if (i == first) {
            word &= ALL_BITS << (begin % WORD_BITS);
        }
        if (i == last) {
            word &= ALL_BITS >> (WORD_BITS - 1 - (end - 1) % WORD_BITS);
        }
        ones += std::bitset<WORD_BITS>(word).count();
    }
    return ones;
}

std::string DecisionHistory::toString(std::size_t count) const {
    const std::size_t span = std::min(count, length);
    std::string text(span, '0');
    for (std::size_t i = 0; i < span; ++i) {
        if (at(length - span + i)) {
            text[i] = '1';
        }
    }
    return text;
}

}  // namespace Talvox
