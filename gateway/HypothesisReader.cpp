#include "gateway/HypothesisReader.h"

#include <pocketsphinx.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <set>

namespace Gateway {

namespace {

/** Paths that are looked at for different texts; many differ in pronunciation and pauses only. */
constexpr int MAX_PATHS = 200;
/** Stands for words that no path of the lattice explains. */
constexpr double LEAST_POSTERIOR = 1e-6;

/** Pauses and noises are not words. */
bool isFiller(const char* word) {
    return word == nullptr || word[0] == '<' || word[0] == '[' || word[0] == '+';
}

/** The word without the number of its pronunciation. */
std::string baseWord(const std::string& word) {
    const std::size_t bracket = word.find('(');
    return bracket == 0 || bracket == std::string::npos ? word : word.substr(0, bracket);
}

double toConfidence(double logSum, int words) {
    return words == 0 ? 0.0 : std::clamp(std::exp(logSum / words), 0.0, 1.0);
}

}  // namespace

HypothesisReader::HypothesisReader(ps_decoder_s* endedDecoder) : decoder(endedDecoder) {}

std::vector<Hypothesis> HypothesisReader::read(std::size_t maxCount) {
    std::vector<Hypothesis> hypotheses;
    const char* best = ps_get_hyp(decoder, nullptr);
    if (best == nullptr || *best == '\0') {
        return hypotheses;
    }
    Hypothesis hypothesis;
    hypothesis.text = best;
    hypothesis.confidence = bestConfidence();
    hypotheses.push_back(hypothesis);
    readWordPosteriors();
    addAlternatives(maxCount, hypotheses);
    return hypotheses;
}

double HypothesisReader::bestConfidence() const {
    logmath_t* logarithms = ps_get_logmath(decoder);
    double logSum = 0.0;
    int words = 0;
    for (ps_seg_t* segment = ps_seg_iter(decoder); segment != nullptr;
         segment = ps_seg_next(segment)) {
        if (!isFiller(ps_seg_word(segment))) {
            logSum +=
                logmath_log_to_ln(logarithms, ps_seg_prob(segment, nullptr, nullptr, nullptr));
            ++words;
        }
    }
    return toConfidence(logSum, words);
}

void HypothesisReader::addAlternatives(std::size_t maxCount, std::vector<Hypothesis>& hypotheses) {
    std::set<std::string> known{hypotheses.front().text};
    ps_nbest_t* path = ps_nbest(decoder);
    for (int i = 0; path != nullptr && i < MAX_PATHS && hypotheses.size() < maxCount; ++i) {
        const char* text = ps_nbest_hyp(path, nullptr);
        if (text != nullptr && *text != '\0' && known.insert(text).second) {
            Hypothesis hypothesis;
            hypothesis.text = text;
            // The decoder is sure of its best text for reasons beyond the words' posteriors.
            hypothesis.confidence =
                std::min(hypotheses.front().confidence, alternativeConfidence(ps_nbest_seg(path)));
            hypotheses.push_back(hypothesis);
        }
        path = ps_nbest_next(path);
    }
    if (path != nullptr) {
        ps_nbest_free(path);
    }
    std::stable_sort(hypotheses.begin() + 1, hypotheses.end(),
                     [](const Hypothesis& left, const Hypothesis& right) {
                         return left.confidence > right.confidence;
                     });
}

void HypothesisReader::readWordPosteriors() {
    ps_lattice_t* lattice = ps_get_lattice(decoder);
    if (lattice == nullptr) {
        return;
    }
    logmath_t* logarithms = ps_get_logmath(decoder);
    for (ps_latnode_iter_t* it = ps_latnode_iter(lattice); it != nullptr;
         it = ps_latnode_iter_next(it)) {
        ps_latnode_t* node = ps_latnode_iter_node(it);
        int16 firstEnd = 0;
        int16 lastEnd = 0;
        const int begin = ps_latnode_times(node, &firstEnd, &lastEnd);
        const char* word = ps_latnode_word(lattice, node);
        const double posterior =
            logmath_log_to_ln(logarithms, ps_latnode_prob(lattice, node, nullptr));
        const auto entry = wordPosteriors.emplace(
            std::make_pair(begin, baseWord(word == nullptr ? "" : word)), posterior);
        entry.first->second = std::max(entry.first->second, posterior);
    }
}

double HypothesisReader::alternativeConfidence(ps_seg_s* segment) const {
    double logSum = 0.0;
    int words = 0;
    for (; segment != nullptr; segment = ps_seg_next(segment)) {
        const char* word = ps_seg_word(segment);
        if (isFiller(word)) {
            continue;
        }
        int begin = 0;
        int end = 0;
        ps_seg_frames(segment, &begin, &end);
        const auto found = wordPosteriors.find(std::make_pair(begin, baseWord(word)));
        logSum += std::max(std::log(LEAST_POSTERIOR), found == wordPosteriors.end()
                                                          ? -std::numeric_limits<double>::infinity()
                                                          : found->second);
        ++words;
    }
    return toConfidence(logSum, words);
}

}  // namespace Gateway
