#include "SweepStore.h"

#include <charconv>

#include "cli/Version.h"

namespace Cli {

namespace {

const char* const FORM = "talvox sweep 1";
const char* const LINE_END = "\t.";
const int64_t NONE = -1;

enum Flag : unsigned { SPEECH = 1, MISSED = 2, EARLY = 4, UNENDED = 8, FALSE_BEGIN = 16 };

/** The FNV-1a hash. */
class Fingerprint {
  public:
    void addByte(unsigned byte) { value_ = (value_ ^ (byte & 0xFFU)) * 1099511628211U; }
    void add(const std::string& text) {
        for (const char character : text) {
            addByte(static_cast<unsigned char>(character));
        }
        addByte(0);
    }
    void add(int64_t number) {
        for (unsigned shift = 0; shift < 64; shift += 8) {
            addByte(static_cast<unsigned>(static_cast<uint64_t>(number) >> shift));
        }
    }
    uint64_t value() const { return value_; }

  private:
    uint64_t value_ = 14695981039346656037U;
};

unsigned flagsOf(const Verdict& verdict) {
    return (verdict.hasSpeech ? SPEECH : 0U) | (verdict.isMissed ? MISSED : 0U) |
           (verdict.isEarly ? EARLY : 0U) | (verdict.isUnended ? UNENDED : 0U) |
           (verdict.isFalseBegin ? FALSE_BEGIN : 0U);
}

void append(std::string& text, const Verdict& verdict) {
    text += std::to_string(flagsOf(verdict));
    for (const int64_t number :
         {verdict.beginLateMs.value_or(NONE), verdict.endLateMs.value_or(NONE), verdict.excessMs}) {
        text += ',';
        text += std::to_string(number);
    }
}

/** Reads numbers one after the other; false at anything else. */
class Numbers {
  public:
    explicit Numbers(const std::string& text)
        : place_(text.data()), end_(text.data() + text.size()) {}

    bool read(int64_t& number) {
        const auto [behind, error] = std::from_chars(place_, end_, number);
        place_ = behind;
        return error == std::errc();
    }
    bool skip(char character) {
        const bool isThere = place_ != end_ && *place_ == character;
        place_ += isThere ? 1 : 0;
        return isThere;
    }
    bool isAtEnd() const { return place_ == end_; }

  private:
    const char* place_;
    const char* end_;
};

bool readVerdict(Numbers& numbers, Verdict& verdict) {
    int64_t flags = 0;
    int64_t beginLateMs = 0;
    int64_t endLateMs = 0;
    if (!numbers.read(flags) || !numbers.skip(',') || !numbers.read(beginLateMs) ||
        !numbers.skip(',') || !numbers.read(endLateMs) || !numbers.skip(',') ||
        !numbers.read(verdict.excessMs)) {
        return false;
    }
    const auto bits = static_cast<unsigned>(flags);
    verdict.hasSpeech = (bits & SPEECH) != 0;
    verdict.isMissed = (bits & MISSED) != 0;
    verdict.isEarly = (bits & EARLY) != 0;
    verdict.isUnended = (bits & UNENDED) != 0;
    verdict.isFalseBegin = (bits & FALSE_BEGIN) != 0;
    verdict.beginLateMs = beginLateMs != NONE ? std::optional(beginLateMs) : std::nullopt;
    verdict.endLateMs = endLateMs != NONE ? std::optional(endLateMs) : std::nullopt;
    return true;
}

bool readVerdicts(const std::string& text, std::size_t setups,
                  std::vector<std::vector<Verdict>>& bySetup) {
    Numbers numbers(text);
    bySetup.assign(setups, {});
    for (std::size_t setup = 0; setup < setups; ++setup) {
        do {
            Verdict verdict;
            if (!readVerdict(numbers, verdict)) {
                return false;
            }
            bySetup[setup].push_back(verdict);
        } while (numbers.skip(' '));
        if (!numbers.skip(';')) {
            return false;
        }
    }
    return numbers.isAtEnd();
}

}  // namespace

SweepStore::SweepStore(const std::string& path, const std::vector<DetectorSetup>& setups)
    : setupCount_(setups.size()) {
    Fingerprint fingerprint;
    fingerprint.add(FORM);
    fingerprint.add(versionText());
    for (const DetectorSetup& setup : setups) {
        fingerprint.add(setup.vad);
        fingerprint.add(int64_t{setup.mode});
    }
    setupsFingerprint_ = fingerprint.value();

    std::ifstream before(path, std::ios::binary);
    const std::string end = LINE_END;
    for (std::string line; std::getline(before, line);) {
        const std::size_t nameEnd = line.find('\t');
        if (nameEnd != std::string::npos && line.size() >= nameEnd + end.size() &&
            line.compare(line.size() - end.size(), end.size(), end) == 0) {
            line.resize(line.size() - end.size());
            lines_[line.substr(0, nameEnd)] = line.substr(nameEnd + 1);
        }
    }
    // A line that was cut off must not take the next one into it.
    file_.open(path, std::ios::binary | std::ios::app);
    file_ << '\n' << std::flush;
}

uint64_t SweepStore::fingerprint(const CorpusSound& sound) const {
    Fingerprint fingerprint;
    fingerprint.add(static_cast<int64_t>(setupsFingerprint_));
    fingerprint.add(int64_t{sound.rateHz});
    for (const Label& label : sound.speech) {
        fingerprint.add(label.startMs);
        fingerprint.add(label.endMs);
    }
    for (const int16_t sample : sound.samples) {
        fingerprint.addByte(static_cast<uint16_t>(sample));
        fingerprint.addByte(static_cast<unsigned>(static_cast<uint16_t>(sample)) >> 8U);
    }
    return fingerprint.value();
}

bool SweepStore::load(const std::string& name, uint64_t fingerprint,
                      std::vector<std::vector<Verdict>>& bySetup) const {
    const auto found = lines_.find(name);
    if (found == lines_.end()) {
        return false;
    }
    const std::size_t tab = found->second.find('\t');
    if (tab == std::string::npos || found->second.substr(0, tab) != std::to_string(fingerprint)) {
        return false;
    }
    if (!readVerdicts(found->second.substr(tab + 1), setupCount_, bySetup)) {
        bySetup.clear();
        return false;
    }
    const std::lock_guard<std::mutex> lock(mutex_);
    ++loaded_;
    return true;
}

void SweepStore::save(const std::string& name, uint64_t fingerprint,
                      const std::vector<std::vector<Verdict>>& bySetup) {
    std::string line = name + '\t' + std::to_string(fingerprint) + '\t';
    for (const std::vector<Verdict>& verdicts : bySetup) {
        for (std::size_t index = 0; index < verdicts.size(); ++index) {
            line += index > 0 ? " " : "";
            append(line, verdicts[index]);
        }
        line += ';';
    }
    line += LINE_END;
    line += '\n';
    const std::lock_guard<std::mutex> lock(mutex_);
    file_ << line << std::flush;
}

}  // namespace Cli
