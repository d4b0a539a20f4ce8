#include "Sweep.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <map>
#include <tuple>

namespace Cli {

namespace {

const std::size_t FOLDS = 5;

std::vector<Verdict> collect(const std::vector<ScoredSound>& sounds, std::size_t point,
                             const std::vector<bool>& isTaken) {
    std::vector<Verdict> verdicts;
    for (std::size_t index = 0; index < sounds.size(); ++index) {
        if (isTaken[index]) {
            const std::vector<Verdict>& added = sounds[index].bySetup[point];
            verdicts.insert(verdicts.end(), added.begin(), added.end());
        }
    }
    return verdicts;
}

/** A number that is worst if there is nothing to count. */
double orWorst(double value) {
    return std::isnan(value) ? NEVER : value;
}

double excess(double value, const std::optional<double>& bound) {
    // The bounds are met in spite of rounding.
    return bound ? std::max(0.0, value - *bound - 1e-9) : 0;
}

/** How well a point fits; less is better. */
using Fit = std::tuple<double, double, double, double>;

Fit fitOf(const Statistics& statistics, const Wanted& wanted) {
    const double lost = lostShare(statistics);
    const double latencyMs = orWorst(statistics.endLateMs.value);
    const double falseBegin =
        std::isnan(statistics.falseBegin.value) ? 0 : statistics.falseBegin.value;
    // One percent more counts as much as ten milliseconds more.
    const double beyond = excess(lost, wanted.lost) + excess(falseBegin, wanted.falseBegin) +
                          excess(latencyMs, wanted.latencyMs) / 1000;
    const bool wordsFirst = wanted.latencyMs.has_value();
    return {beyond, wordsFirst ? lost : latencyMs, wordsFirst ? latencyMs : lost,
            orWorst(statistics.endLateP90Ms)};
}

bool isMet(const Statistics& statistics, const Wanted& wanted) {
    return std::get<0>(fitOf(statistics, wanted)) <= 0;
}

std::size_t choose(const std::vector<Statistics>& figures, const Wanted& wanted) {
    std::size_t best = 0;
    for (std::size_t point = 1; point < figures.size(); ++point) {
        if (fitOf(figures[point], wanted) < fitOf(figures[best], wanted)) {
            best = point;
        }
    }
    return best;
}

/** The part that each sound belongs to; file names are dealt out in their order. */
std::vector<std::size_t> makeFolds(const std::vector<ScoredSound>& sounds) {
    std::map<std::string, std::size_t> folds;
    const auto nameOf = [](const ScoredSound& sound) {
        return sound.entry.name.substr(sound.entry.name.rfind('/') + 1);
    };
    for (const ScoredSound& sound : sounds) {
        folds.emplace(nameOf(sound), 0);
    }
    std::size_t next = 0;
    for (auto& [name, fold] : folds) {
        fold = next++ % FOLDS;
    }
    std::vector<std::size_t> ofSounds;
    ofSounds.reserve(sounds.size());
    for (const ScoredSound& sound : sounds) {
        ofSounds.push_back(folds[nameOf(sound)]);
    }
    return ofSounds;
}

void markPareto(std::vector<SweepPoint>& points) {
    std::vector<SweepPoint*> order;
    order.reserve(points.size());
    for (SweepPoint& point : points) {
        order.push_back(&point);
    }
    const auto key = [](const SweepPoint& point) {
        return std::make_pair(point.lost(), orWorst(point.statistics.endLateMs.value));
    };
    std::stable_sort(order.begin(), order.end(), [&key](SweepPoint* left, SweepPoint* right) {
        return key(*left) < key(*right);
    });
    double best = NEVER;
    for (SweepPoint* point : order) {
        const double latencyMs = orWorst(point->statistics.endLateMs.value);
        point->isPareto = latencyMs < best;
        best = std::min(best, latencyMs);
    }
}

}  // namespace

double lostShare(const Statistics& statistics) {
    return orWorst(statistics.early.value + statistics.missed.value);
}

double SweepPoint::lost() const {
    return lostShare(statistics);
}

std::vector<SweepPoint> makePoints(const std::vector<ScoredSound>& sounds,
                                   const std::vector<DetectorSetup>& setups) {
    std::vector<bool> isTaken(sounds.size());
    std::transform(sounds.begin(), sounds.end(), isTaken.begin(),
                   [](const ScoredSound& sound) { return sound.fault.empty(); });
    std::vector<SweepPoint> points;
    points.reserve(setups.size());
    for (std::size_t point = 0; point < setups.size(); ++point) {
        points.push_back(
            {setups[point].vad, summarize(collect(sounds, point, isTaken), false), false});
    }
    markPareto(points);
    return points;
}

Advice advise(const std::vector<ScoredSound>& sounds, const std::vector<SweepPoint>& points,
              const Wanted& wanted) {
    Advice advice;
    std::vector<Statistics> figures;
    figures.reserve(points.size());
    for (const SweepPoint& point : points) {
        figures.push_back(point.statistics);
    }
    advice.point = choose(figures, wanted);
    advice.meetsWanted = isMet(figures[advice.point], wanted);

    const std::vector<std::size_t> folds = makeFolds(sounds);
    std::vector<Verdict> heldOut;
    for (std::size_t fold = 0; fold < FOLDS; ++fold) {
        std::vector<bool> isOutside(sounds.size());
        std::vector<bool> isInside(sounds.size());
        for (std::size_t index = 0; index < sounds.size(); ++index) {
            isInside[index] = sounds[index].fault.empty() && folds[index] == fold;
            isOutside[index] = sounds[index].fault.empty() && folds[index] != fold;
        }
        for (std::size_t point = 0; point < points.size(); ++point) {
            figures[point] = summarize(collect(sounds, point, isOutside), false);
        }
        const std::size_t chosen = choose(figures, wanted);
        const std::vector<Verdict> verdicts = collect(sounds, chosen, isInside);
        if (verdicts.empty()) {
            continue;
        }
        heldOut.insert(heldOut.end(), verdicts.begin(), verdicts.end());
        ++advice.folds;
        advice.foldsThatAgree += chosen == advice.point ? 1 : 0;
    }
    advice.heldOut = summarize(heldOut);
    return advice;
}

}  // namespace Cli
