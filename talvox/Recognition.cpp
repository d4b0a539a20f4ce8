#include "talvox/Recognition.h"

#include <utility>

namespace Talvox {

Recognition::Recognition(Outcome verdict, boost::shared_ptr<const RecognitionResults> hypotheses,
                         std::string request)
    : results(std::move(hypotheses)), outcome(verdict), requestId(std::move(request)) {}

Recognition::Outcome Recognition::decideOutcome(const RecognitionResults& hypotheses,
                                                const Settings& settings) {
    if (hypotheses.empty()) {
        return OutcomeUncertain;
    }
    const bool isSingle = hypotheses.size() == 1;
    const float best = hypotheses[0].getConfidence();
    const float next = isSingle ? 0.0F : hypotheses[1].getConfidence();
    if (best == RecognitionResult::UNKNOWN_CONFIDENCE) {
        if (isSingle) {
            return OutcomeAccepted;
        }
    } else if (best >= settings.getFloat(Settings::SKS_UPPER_CONFIDENCE) &&
               best - next >= settings.getFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE)) {
        return OutcomeAccepted;
    }
    return best < settings.getFloat(Settings::SKS_LOWER_CONFIDENCE) ? OutcomeRejected
                                                                    : OutcomeUncertain;
}

}  // namespace Talvox
