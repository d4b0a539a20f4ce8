#include "Progress.h"

#include <algorithm>
#include <cmath>

#include "Text.h"
#include "pal/kd_time.h"

namespace Cli {

namespace {

const int64_t NS_PER_MS = 1000000;
const int64_t QUIET_MS = 1000;
const int64_t INTERVAL_MS = 200;
const int WIDTH = 30;

int64_t nowMs() {
    return kdGetTimeUST() / NS_PER_MS;
}

std::string durationText(int64_t ms) {
    const int64_t seconds = (ms + 999) / 1000;
    return seconds < 120 ? std::to_string(seconds) + " s"
                         : std::to_string((seconds + 59) / 60) + " min";
}

}  // namespace

Progress::Progress(std::ostream& output, bool isTerminal)
    : out_(output), isTerminal_(isTerminal), startMs_(nowMs()) {}

Progress::~Progress() {
    if (isShown_) {
        out_ << "\r\x1b[K" << std::flush;
    }
}

void Progress::show(double share) {
    const std::lock_guard<std::mutex> lock(mutex_);
    const int64_t elapsedMs = nowMs() - startMs_;
    highest_ = std::max(highest_, std::min(1.0, share));
    if (!isTerminal_ || elapsedMs < QUIET_MS || elapsedMs - shownMs_ < INTERVAL_MS) {
        return;
    }
    shownMs_ = elapsedMs;
    isShown_ = true;
    out_ << "\r\x1b[K" << bar(highest_, elapsedMs) << std::flush;
}

std::string Progress::bar(double share, int64_t elapsedMs) const {
    const auto full = static_cast<std::size_t>(std::lround(share * WIDTH));
    std::string text = "[" + std::string(full, '#');
    text += std::string(WIDTH - full, '-');
    text += "] " + fixed(std::floor(share * 100), 3, 0) + " %";
    if (share > 0) {
        const double leftMs = static_cast<double>(elapsedMs) * (1 - share) / share;
        text += ", " + durationText(std::llround(leftMs)) + " left";
    }
    return text;
}

}  // namespace Cli
