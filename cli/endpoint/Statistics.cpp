#include "Statistics.h"

#include <algorithm>
#include <array>
#include <cmath>

#include "cli/corpus/Dice.h"

namespace Cli {

namespace {

const int RESAMPLES = 1000;
const uint64_t RESAMPLING_SEED = 20;
const double NAN_VALUE = std::numeric_limits<double>::quiet_NaN();

/** The figures of one sample, in a fixed order, so that each is resampled in the same way. */
enum Figure { MISSED, FALSE_BEGIN, EARLY, UNENDED, BEGIN_LATE, END_LATE, EXCESS, FIGURES };

using Figures = std::array<double, FIGURES>;

double shareOf(double part, double whole) {
    return whole > 0 ? part / whole : NAN_VALUE;
}

/** Adds sessions up. */
class Tally {
  public:
    void clear() { *this = Tally(std::move(begins_), std::move(ends_)); }

    void add(const Verdict& verdict) {
        ++sessions_;
        sessionsWithSpeech_ += verdict.hasSpeech ? 1 : 0;
        missed_ += verdict.isMissed ? 1 : 0;
        falseBegins_ += verdict.isFalseBegin ? 1 : 0;
        early_ += verdict.isEarly ? 1 : 0;
        unended_ += verdict.isUnended ? 1 : 0;
        excessMs_ += static_cast<double>(verdict.excessMs);
        if (verdict.beginLateMs) {
            begins_.push_back(static_cast<double>(*verdict.beginLateMs));
        }
        if (verdict.endLateMs) {
            ends_.push_back(static_cast<double>(*verdict.endLateMs));
        } else if (verdict.isUnended) {
            ends_.push_back(NEVER);
        }
    }

    Figures figures() {
        return {shareOf(missed_, sessionsWithSpeech_),
                shareOf(falseBegins_, sessions_),
                shareOf(early_, sessionsWithSpeech_),
                shareOf(unended_, sessionsWithSpeech_),
                quantile(begins_, 0.5),
                quantile(ends_, 0.5),
                shareOf(excessMs_, sessions_)};
    }

    double beginP90() { return quantile(begins_, 0.9); }
    double endP90() { return quantile(ends_, 0.9); }
    int sessions() const { return sessions_; }
    int sessionsWithSpeech() const { return sessionsWithSpeech_; }

    Tally() = default;

  private:
    Tally(std::vector<double> begins, std::vector<double> ends)
        : begins_(std::move(begins)), ends_(std::move(ends)) {
        begins_.clear();
        ends_.clear();
    }

    int sessions_ = 0;
    int sessionsWithSpeech_ = 0;
    int missed_ = 0;
    int falseBegins_ = 0;
    int early_ = 0;
    int unended_ = 0;
    double excessMs_ = 0;
    std::vector<double> begins_;
    std::vector<double> ends_;
};

/** Each figure of each resample. */
std::array<std::vector<double>, FIGURES> resample(const std::vector<Verdict>& verdicts) {
    std::array<std::vector<double>, FIGURES> drawn;
    Dice dice(RESAMPLING_SEED);
    Tally tally;
    for (int round = 0; round < RESAMPLES; ++round) {
        tally.clear();
        for (std::size_t index = 0; index < verdicts.size(); ++index) {
            tally.add(verdicts[dice.below(verdicts.size())]);
        }
        const Figures figures = tally.figures();
        for (std::size_t figure = 0; figure < FIGURES; ++figure) {
            if (!std::isnan(figures[figure])) {
                drawn[figure].push_back(figures[figure]);
            }
        }
    }
    return drawn;
}

Estimate toEstimate(double value, std::vector<double>& drawn) {
    return {value, quantile(drawn, 0.025), quantile(drawn, 0.975)};
}

void widenShare(Estimate& share, int count) {
    const double margin = std::min(1.0, 3.0 / count);
    if (count > 0 && share.value <= 0) {
        share.high = margin;
    } else if (count > 0 && share.value >= 1) {
        share.low = 1 - margin;
    }
}

}  // namespace

double quantile(std::vector<double>& values, double share) {
    if (values.empty()) {
        return NAN_VALUE;
    }
    // Not exactly representable shares must not reach the next place.
    const double rank = std::ceil(share * static_cast<double>(values.size()) - 1e-9);
    const auto place = static_cast<std::ptrdiff_t>(std::max(0.0, rank - 1));
    std::nth_element(values.begin(), values.begin() + place, values.end());
    return values[static_cast<std::size_t>(place)];
}

Statistics summarize(const std::vector<Verdict>& verdicts, bool withBounds) {
    Tally tally;
    for (const Verdict& verdict : verdicts) {
        tally.add(verdict);
    }
    const Figures figures = tally.figures();
    std::array<std::vector<double>, FIGURES> drawn;
    if (withBounds) {
        drawn = resample(verdicts);
    }
    Statistics statistics;
    statistics.sessions = tally.sessions();
    statistics.sessionsWithSpeech = tally.sessionsWithSpeech();
    statistics.missed = toEstimate(figures[MISSED], drawn[MISSED]);
    statistics.falseBegin = toEstimate(figures[FALSE_BEGIN], drawn[FALSE_BEGIN]);
    statistics.early = toEstimate(figures[EARLY], drawn[EARLY]);
    statistics.unended = toEstimate(figures[UNENDED], drawn[UNENDED]);
    statistics.beginLateMs = toEstimate(figures[BEGIN_LATE], drawn[BEGIN_LATE]);
    statistics.beginLateP90Ms = tally.beginP90();
    statistics.endLateMs = toEstimate(figures[END_LATE], drawn[END_LATE]);
    statistics.endLateP90Ms = tally.endP90();
    statistics.excessMs = toEstimate(figures[EXCESS], drawn[EXCESS]);
    if (withBounds) {
        widenShare(statistics.missed, statistics.sessionsWithSpeech);
        widenShare(statistics.falseBegin, statistics.sessions);
        widenShare(statistics.early, statistics.sessionsWithSpeech);
        widenShare(statistics.unended, statistics.sessionsWithSpeech);
    }
    return statistics;
}

}  // namespace Cli
