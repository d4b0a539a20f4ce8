#include "Labels.h"

#include <cerrno>
#include <charconv>
#include <cmath>
#include <cstring>
#include <fstream>

#include "cli/Text.h"

namespace Cli {

const char* const NOISE_LABEL = "(noise)";

namespace {

const double LATEST_S = 1e6;
const int64_t TOLERANCE_MS = 10;

std::string toSeconds(int64_t ms) {
    return fixed(static_cast<double>(ms) / 1000, 0, 3) + " s";
}

/** One line of a label file; knows where it stands for the sake of errors. */
class LabelLine {
  public:
    LabelLine(const std::string& path, int number, const std::string& text)
        : place_(path + ':' + std::to_string(number) + ": ") {
        std::size_t begin = 0;
        for (int field = 0; field < 2; ++field) {
            const std::size_t tab = text.find('\t', begin);
            fields_.push_back(text.substr(begin, tab - begin));
            begin = tab == std::string::npos ? text.size() : tab + 1;
        }
        fields_.push_back(text.substr(begin));
    }

    Label parse() const {
        const int64_t startMs = toMs(fields_[0], "start");
        if (fields_[1].empty()) {
            fail("the label has no end; expected start, end and text, separated by tabs");
        }
        const int64_t endMs = toMs(fields_[1], "end");
        if (endMs < startMs) {
            fail("the label ends at " + toSeconds(endMs) + ", before its start at " +
                 toSeconds(startMs));
        }
        if (endMs == startMs) {
            fail("the label at " + toSeconds(startMs) + " has no length");
        }
        return {startMs, endMs, fields_[2]};
    }

    [[noreturn]] void fail(const std::string& reason) const { throw LabelError(place_ + reason); }

  private:
    int64_t toMs(const std::string& field, const char* name) const {
        double seconds = 0;
        const char* const end = field.data() + field.size();
        const auto [behind, error] = std::from_chars(field.data(), end, seconds);
        if (error != std::errc() || behind != end || !(std::fabs(seconds) < LATEST_S)) {
            fail("the " + std::string(name) + " \"" + printable(field) +
                 "\" is not a time in seconds");
        }
        return std::llround(seconds * 1000);
    }

    std::string place_;
    std::vector<std::string> fields_;
};

void checkPlace(const LabelLine& line, const Label& label, const Label& before, int64_t soundMs) {
    if (label.startMs < 0) {
        line.fail("the label begins before the sound");
    }
    if (label.endMs > soundMs + TOLERANCE_MS) {
        line.fail("the label ends at " + toSeconds(label.endMs) +
                  ", behind the end of the sound (" + toSeconds(soundMs) + ')');
    }
    if (label.startMs < before.endMs) {
        line.fail("the label begins at " + toSeconds(label.startMs) +
                  ", before the end of the one above (" + toSeconds(before.endMs) + ')');
    }
}

bool isSkipped(const std::string& line) {
    return line.empty() || line[0] == '\\';
}

void appendLabel(std::string& text, const Label& label) {
    text += fixed(static_cast<double>(label.startMs) / 1000, 0, 6);
    text += '\t';
    text += fixed(static_cast<double>(label.endMs) / 1000, 0, 6);
    text += '\t';
    text += label.text;
    text += '\n';
}

}  // namespace

std::vector<Label> readLabels(const std::string& path, int64_t soundMs) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        throw LabelError(path + ":1: cannot read it: " + std::strerror(errno));
    }
    std::vector<Label> speech;
    Label before;
    bool isLabelled = false;
    int number = 0;
    for (std::string text; std::getline(file, text);) {
        ++number;
        if (!text.empty() && text.back() == '\r') {
            text.pop_back();
        }
        if (isSkipped(text)) {
            continue;
        }
        const LabelLine line(path, number, text);
        const Label label = line.parse();
        checkPlace(line, label, before, soundMs);
        before = label;
        isLabelled = true;
        if (label.text != NOISE_LABEL) {
            speech.push_back(label);
        }
    }
    if (!isLabelled) {
        throw LabelError(path + ":1: there is no label; one with the text " + NOISE_LABEL +
                         " marks a sound without speech");
    }
    return speech;
}

std::string labelText(const std::vector<Label>& speech, int64_t soundMs) {
    std::string text;
    for (const Label& label : speech) {
        appendLabel(text, label);
    }
    if (speech.empty()) {
        appendLabel(text, {0, soundMs, NOISE_LABEL});
    }
    return text;
}

}  // namespace Cli
