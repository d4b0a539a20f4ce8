#include "gateway/ResultDocument.h"

#include <algorithm>
#include <cstdio>

namespace Gateway {

std::string makeResultDocument(const std::vector<Hypothesis>& hypotheses) {
    std::string document =
        "<?xml version=\"1.0\" encoding=\"utf-8\"?><recognitionResults success=\"";
    document += hypotheses.empty() ? "0\">" : "1\">";
    for (const Hypothesis& hypothesis : hypotheses) {
        char confidence[16];
        std::snprintf(confidence, sizeof(confidence), "%.4f",
                      std::clamp(hypothesis.confidence, 0.0, 1.0));
        document += "<variant confidence=\"";
        document += confidence;
        document += "\">" + escapeXml(hypothesis.text) + "</variant>";
    }
    return document + "</recognitionResults>";
}

std::string escapeXml(const std::string& text) {
    std::string escaped;
    for (const char c : text) {
        switch (c) {
            case '&':
                escaped += "&amp;";
                break;
            case '<':
                escaped += "&lt;";
                break;
            case '>':
                escaped += "&gt;";
                break;
            case '"':
                escaped += "&quot;";
                break;
            case '\'':
                escaped += "&apos;";
                break;
            default:
                escaped += static_cast<unsigned char>(c) < 0x20 ? ' ' : c;
        }
    }
    return escaped;
}

}  // namespace Gateway
