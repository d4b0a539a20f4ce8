#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "gateway/Hypothesis.h"

namespace Gateway {

/** What is known of a request so far. The texts are the client's, byte for byte. */
struct RequestSummary {
    std::string requestId;
    std::string language;
    std::string topic;
    std::string soundType;
    std::string transcripts;
    /** What was wrong with the sound without making it useless. */
    std::string remark;
    /** Why the request was refused; empty if it was not. */
    std::string refusal;
    bool isCanceled = false;
    std::size_t bodyBytes = 0;
    std::size_t soundBytes = 0;
    uint64_t decodeMs = 0;
    std::vector<Hypothesis> hypotheses;
};

}  // namespace Gateway
