#include "support/Spawn.h"

extern char** environ;

namespace TestSupport {

std::vector<std::string> mergeEnvironment(const Environment& changes) {
    std::vector<std::string> lines;
    lines.reserve(changes.size());
    for (const auto& change : changes) {
        lines.push_back(change.first + "=" + change.second);
    }
    for (char** entry = environ; *entry != nullptr; ++entry) {
        const std::string line(*entry);
        bool changed = false;
        for (const auto& change : changes) {
            changed = changed || line.compare(0, change.first.size() + 1, change.first + "=") == 0;
        }
        if (!changed) {
            lines.push_back(line);
        }
    }
    return lines;
}

std::vector<char*> toPointers(std::vector<std::string>& texts) {
    std::vector<char*> pointers;
    pointers.reserve(texts.size() + 1);
    for (std::string& text : texts) {
        pointers.push_back(text.data());
    }
    pointers.push_back(nullptr);
    return pointers;
}

}  // namespace TestSupport
