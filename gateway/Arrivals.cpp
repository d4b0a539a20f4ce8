#include "gateway/Arrivals.h"

#include <algorithm>

#include "core/util/Time.h"

namespace Gateway {

namespace {

std::string field(const char* name, KDust duration) {
    return std::string(" ") + name + "=" + std::to_string(duration / Util::NS_PER_MS) + "ms";
}

}  // namespace

void Arrivals::add(KDust at) {
    if (pieces == 0) {
        firstAt = at;
    } else {
        longestGap = std::max(longestGap, at - lastAt);
    }
    lastAt = at;
    ++pieces;
}

void Arrivals::answer(KDust at) {
    answerAt = at;
    isAnswered = true;
}

std::string Arrivals::describe() const {
    std::string text = "pieces=" + std::to_string(pieces);
    if (pieces > 0) {
        text += field("first", firstAt - headAt) + field("last", lastAt - headAt);
    }
    if (pieces > 1) {
        text += field("gap", longestGap);
    }
    if (isAnswered) {
        text += field("answer", answerAt - lastAt);
    }
    return text;
}

}  // namespace Gateway
