/* Lines of a name and a pattern up to an empty line, then a byte per step: the recogniser must
 * report what a plain reading of the patterns finds, and when. */
#include <algorithm>
#include <boost/make_shared.hpp>
#include <cstdint>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Fuzz.h"
#include "core/sensor/ManualProximitySource.h"
#include "core/sensor/ProximityGestureRecognizer.h"
#include "pal/kd_time.h"

namespace {

using Fuzz::require;

constexpr int64_t NS_PER_MS = 1000000;
constexpr std::size_t GESTURES_MAX = 12;
constexpr int STEPS_MAX = 300;
constexpr std::size_t SPANS_MAX = 16;
constexpr int64_t PAUSES_US[] = {0,        400,      600,      999,     1000,    2000,    10000,
                                 49000,    49999,    50000,    51000,   99000,   100000,  100500,
                                 250000,   499000,   500000,   501000,  600000,  601000,  999000,
                                 1000000,  1001000,  2000000,  3000000, 5000000, 9999000, 10000000,
                                 30000000, 59999000, 60000000, 60001000};

/** What a callback may do from inside; done once, at the next report. */
enum CallbackAction { NOTHING, STOP, RESTART, ADD, DROP, FALL_SILENT };

/** One of two that are to behave alike. */
class Player {
  public:
    Player() = default;
    Player(const Player&) = delete;
    Player& operator=(const Player&) = delete;
    virtual ~Player() = default;

    virtual bool start() = 0;
    virtual void stop() = 0;
    /** @return whether the pattern is accepted */
    virtual bool add(const std::string& name, const std::string& pattern) = 0;
    virtual void sample(bool isNear) = 0;
    virtual void pass(int64_t nanoseconds) = 0;
    virtual void drop() = 0;
    virtual void setListening(bool hears) = 0;

    void arm(CallbackAction action, const std::string& name, const std::string& pattern) {
        armed = action;
        newName = name;
        newPattern = pattern;
    }

    /** Every report so far, with its time. */
    std::vector<std::pair<int64_t, std::string>> reports;

  protected:
    void onReport(int64_t now, const std::string& name) {
        reports.emplace_back(now, name);
        switch (std::exchange(armed, NOTHING)) {
            case STOP:
                stop();
                break;
            case RESTART:
                stop();
                start();
                break;
            case ADD:
                add(newName, newPattern);
                break;
            case DROP:
                drop();
                break;
            case FALL_SILENT:
                setListening(false);
                break;
            default:
                break;
        }
    }

  private:
    CallbackAction armed = NOTHING;
    std::string newName;
    std::string newPattern;
};

/** The recogniser. */
class Recognizer : public Player {
  public:
    Recognizer() { kdUseManualClockKOR(0); }
    ~Recognizer() override { recognizer.reset(); }

    bool start() override { return recognizer && recognizer->start(); }
    void stop() override {
        if (recognizer) {
            recognizer->stop();
        }
    }
    bool add(const std::string& name, const std::string& pattern) override {
        return recognizer && recognizer->addGesture(name, pattern).empty();
    }
    void sample(bool isNear) override { source->feed(isNear); }
    void pass(int64_t nanoseconds) override { kdAdvanceClockKOR(nanoseconds); }
    void drop() override { recognizer.reset(); }
    void setListening(bool hears) override {
        if (recognizer) {
            recognizer->setCallback(
                hears ? Sensor::ProximityGestureRecognizer::Callback(
                            [this](const std::string& name) { onReport(kdGetTimeUST(), name); })
                      : nullptr);
        }
    }

  private:
    boost::shared_ptr<Sensor::ManualProximitySource> source =
        boost::make_shared<Sensor::ManualProximitySource>();
    boost::shared_ptr<Sensor::ProximityGestureRecognizer> recognizer =
        boost::make_shared<Sensor::ProximityGestureRecognizer>(source);
};

/** One span of a pattern. */
struct Wanted {
    bool isNear = false;
    int64_t least = 0;
    std::optional<int64_t> most;
};

std::optional<int64_t> readNumber(const std::string& digits) {
    int64_t value = 0;
    for (const char c : digits) {
        if (c < '0' || c > '9') {
            return std::nullopt;
        }
        value = std::min<int64_t>(value * 10 + (c - '0'), 1000000);
    }
    const bool isNumber = !digits.empty() && digits.size() <= 5 && value <= 60000;
    return isNumber ? std::optional<int64_t>(value) : std::nullopt;
}

std::optional<Wanted> readSpan(const std::string& text) {
    Wanted span;
    span.isNear = text.compare(0, 5, "near:") == 0;
    if (!span.isNear && text.compare(0, 4, "far:") != 0) {
        return std::nullopt;
    }
    const std::string lengths = text.substr(span.isNear ? 5 : 4);
    const std::size_t dash = std::min(lengths.find('-'), lengths.size());
    const std::optional<int64_t> least = readNumber(lengths.substr(0, dash));
    if (dash == lengths.size() || !least) {
        return std::nullopt;
    }
    span.least = *least;
    if (dash + 1 < lengths.size()) {
        span.most = readNumber(lengths.substr(dash + 1));
        if (!span.most || *span.most < span.least) {
            return std::nullopt;
        }
    }
    return span;
}

/** The spans of a pattern; none where it is not one. */
std::vector<Wanted> readPattern(const std::string& text) {
    std::vector<Wanted> spans;
    std::string piece;
    for (const char c : text + " ") {
        if (c != ' ' && c != '\t') {
            piece += c;
            continue;
        }
        if (piece.empty()) {
            continue;
        }
        const std::optional<Wanted> span = readSpan(piece);
        if (!span || (!spans.empty() && spans.back().isNear == span->isNear)) {
            return {};
        }
        spans.push_back(*span);
        piece.clear();
    }
    return spans.size() <= SPANS_MAX ? spans : std::vector<Wanted>();
}

/** A plain reading of what the recogniser promises. */
class Reference : public Player {
  public:
    bool start() override {
        if (!isThere || isRunning) {
            return isThere;
        }
        isRunning = true;
        hasSpan = false;
        ended.clear();
        return true;
    }
    void stop() override {
        isRunning = false;
        ++stops;
    }
    bool add(const std::string& name, const std::string& pattern) override {
        const Gesture gesture{name, readPattern(pattern), true};
        if (!isThere || name.empty() || gesture.spans.empty()) {
            return false;
        }
        for (Gesture& known : gestures) {
            if (known.name == name) {
                known = gesture;
                return true;
            }
        }
        gestures.push_back(gesture);
        return true;
    }
    void sample(bool isNear) override {
        if (!isRunning || !isThere || (hasSpan && isNearNow == isNear)) {
            return;
        }
        const unsigned before = stops;
        const bool hadSpan = hasSpan;
        if (hadSpan) {
            ended.push_back({isNearNow, (now - since) / NS_PER_MS});
        }
        hasSpan = true;
        isNearNow = isNear;
        since = now;
        std::vector<std::string> names;
        for (Gesture& gesture : gestures) {
            gesture.isDone = false;
            const bool isBounded = gesture.spans.back().most.has_value();
            if (hadSpan && isBounded && fits(gesture, gesture.spans.size())) {
                names.push_back(gesture.name);
            }
        }
        report(names);
        if (stops == before) {
            reportHeld();
        }
        settle();
    }
    void pass(int64_t nanoseconds) override {
        const int64_t end = now + nanoseconds;
        for (;;) {
            int64_t next = end + 1;
            for (const Gesture& gesture : gestures) {
                next = std::min(next, dueTime(gesture).value_or(next));
            }
            if (next > end) {
                break;
            }
            now = next;
            reportHeld();
            settle();
        }
        now = end;
    }
    void drop() override { isDropped = true; }
    void setListening(bool listens) override { hears = listens && !isDropped; }

  private:
    struct Gesture {
        std::string name;
        std::vector<Wanted> spans;
        bool isDone = false;
    };
    struct Seen {
        bool isNear;
        int64_t ms;
    };

    /** A recogniser that was dropped from inside a callback lasts as long as what called it. */
    void settle() {
        if (isDropped) {
            isThere = false;
            isRunning = false;
        }
    }

    /** Whether the newest spans are the first `count` of the gesture. */
    bool fits(const Gesture& gesture, std::size_t count) const {
        if (ended.size() < count) {
            return false;
        }
        for (std::size_t i = 0; i < count; ++i) {
            const Seen& seen = ended[ended.size() - count + i];
            const Wanted& wanted = gesture.spans[i];
            if (seen.isNear != wanted.isNear || seen.ms < wanted.least ||
                seen.ms > wanted.most.value_or(seen.ms)) {
                return false;
            }
        }
        return true;
    }

    /** When a span that goes on completes the gesture. */
    std::optional<int64_t> dueTime(const Gesture& gesture) const {
        const Wanted& last = gesture.spans.back();
        if (!isRunning || !isThere || !hasSpan || gesture.isDone || last.most ||
            last.isNear != isNearNow || !fits(gesture, gesture.spans.size() - 1)) {
            return std::nullopt;
        }
        return since + last.least * NS_PER_MS;
    }

    void reportHeld() {
        std::vector<std::string> names;
        for (Gesture& gesture : gestures) {
            if (const std::optional<int64_t> due = dueTime(gesture); due && *due <= now) {
                gesture.isDone = true;
                names.push_back(gesture.name);
            }
        }
        report(names);
    }

    void report(const std::vector<std::string>& names) {
        const unsigned before = stops;
        for (const std::string& name : names) {
            if (hears && stops == before) {
                onReport(now, name);
            }
        }
    }

    std::vector<Gesture> gestures;
    std::vector<Seen> ended;
    bool isThere = true;
    bool isDropped = false;
    bool isRunning = false;
    bool hears = false;
    bool hasSpan = false;
    bool isNearNow = false;
    int64_t since = 0;
    int64_t now = 0;
    unsigned stops = 0;
};

using Lines = std::vector<std::pair<std::string, std::string>>;

Lines takeGestures(Fuzz::Input& input) {
    Lines lines;
    while (!input.isEmpty() && lines.size() < GESTURES_MAX) {
        const std::string line = input.takeLine();
        if (line.empty()) {
            break;
        }
        const std::size_t blank = std::min(line.find(' '), line.size());
        lines.emplace_back(line.substr(0, blank), line.substr(blank));
    }
    return lines;
}

/** Both do the same; what they answer must be the same. */
class Match {
  public:
    explicit Match(Fuzz::Input& source) : input(source), lines(takeGestures(source)) {
        recognizer.setListening(true);
        reference.setListening(true);
        for (const auto& [name, pattern] : lines) {
            add(name, pattern);
        }
        start();
    }

    void step() {
        const uint8_t byte = input.takeByte();
        const int64_t pause = PAUSES_US[byte >> 1U & 31U] * 1000;
        recognizer.pass(pause);
        reference.pass(pause);
        requireSameReports();
        if ((byte & 0x80U) != 0) {
            rareStep();
        } else {
            recognizer.sample((byte & 1U) != 0);
            reference.sample((byte & 1U) != 0);
        }
        requireSameReports();
    }

  private:
    void start() { require(recognizer.start() == reference.start(), "both start"); }
    void add(const std::string& name, const std::string& pattern) {
        require(recognizer.add(name, pattern) == reference.add(name, pattern),
                "a pattern is accepted by its grammar");
    }
    void requireSameReports() {
        require(recognizer.reports == reference.reports, "gestures are reported as described");
    }

    void rareStep() {
        const uint8_t byte = input.takeByte();
        const auto line = lines.empty() ? Lines::value_type() : lines[byte / 8U % lines.size()];
        switch (byte % 8) {
            case 0:
                recognizer.stop();
                reference.stop();
                break;
            case 1:
                start();
                break;
            case 2:
                add(line.first, line.second);
                break;
            case 3:
                recognizer.setListening(true);
                reference.setListening(true);
                break;
            default: {
                static constexpr CallbackAction ACTIONS[] = {STOP, RESTART, ADD, FALL_SILENT};
                const CallbackAction action = byte == 0xFF ? DROP : ACTIONS[byte % 4];
                recognizer.arm(action, line.first, line.second);
                reference.arm(action, line.first, line.second);
            }
        }
    }

    Fuzz::Input& input;
    const Lines lines;
    Recognizer recognizer;
    Reference reference;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size) {
    const Fuzz::QuietLog log;
    Fuzz::Input input(data, size);
    Match match(input);
    for (int i = 0; i < STEPS_MAX && !input.isEmpty(); ++i) {
        match.step();
    }
    return 0;
}
