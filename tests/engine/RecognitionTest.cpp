#include "talvox/Recognition.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <limits>
#include <vector>

using Talvox::Recognition;
using Talvox::RecognitionResult;
using Talvox::RecognitionResults;
using Talvox::Settings;

namespace {

Settings thresholds(float upper, float winnerLead, float lower) {
    Settings settings;
    settings.putFloat(Settings::SKS_UPPER_CONFIDENCE, upper);
    settings.putFloat(Settings::SKS_WINNER_LEAD_CONFIDENCE, winnerLead);
    settings.putFloat(Settings::SKS_LOWER_CONFIDENCE, lower);
    return settings;
}

Recognition::Outcome outcomeOf(const std::vector<float>& confidences,
                               const Settings& settings = Settings()) {
    RecognitionResults results;
    for (const float confidence : confidences) {
        results.emplace_back("text", confidence);
    }
    return Recognition::decideOutcome(results, settings);
}

}  // namespace

TEST(RecognitionOutcome, NumbersAreFixed) {
    EXPECT_EQ(0, Recognition::OutcomeRejected);
    EXPECT_EQ(1, Recognition::OutcomeAccepted);
    EXPECT_EQ(2, Recognition::OutcomeUncertain);
}

TEST(RecognitionOutcome, AConfidentHypothesisClearlyAheadIsAccepted) {
    EXPECT_EQ(Recognition::OutcomeAccepted, outcomeOf({0.95F, 0.5F}));
    EXPECT_EQ(Recognition::OutcomeAccepted, outcomeOf({0.95F, 0.5F, 0.94F}));
}

TEST(RecognitionOutcome, ASmallLeadIsUncertain) {
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({0.95F, 0.8F}));
}

TEST(RecognitionOutcome, BelowTheLowerConfidenceIsRejected) {
    EXPECT_EQ(Recognition::OutcomeRejected, outcomeOf({0.3F}));
    EXPECT_EQ(Recognition::OutcomeRejected, outcomeOf({0.3F, 0.0F}));
}

TEST(RecognitionOutcome, BetweenTheThresholdsIsUncertain) {
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({0.6F}));
}

TEST(RecognitionOutcome, ASingleHypothesisLeadsOverZero) {
    EXPECT_EQ(Recognition::OutcomeAccepted, outcomeOf({0.9F}));
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({0.9F}, thresholds(0.9F, 0.95F, 0.4F)));
}

TEST(RecognitionOutcome, EqualityReachesTheUpperThresholdsAndIsNotBelowTheLowerOne) {
    EXPECT_EQ(Recognition::OutcomeAccepted,
              outcomeOf({0.75F, 0.5F}, thresholds(0.75F, 0.25F, 0.5F)));
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({0.5F}, thresholds(0.75F, 0.25F, 0.5F)));
}

// In double precision the lead would be a little too small.
TEST(RecognitionOutcome, TheLeadIsComputedInSinglePrecision) {
    EXPECT_EQ(Recognition::OutcomeAccepted,
              outcomeOf({0.553F, 0.168F}, thresholds(0.5F, 0.385F, 0.4F)));
}

TEST(RecognitionOutcome, NoHypothesisIsUncertain) {
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({}));
}

TEST(RecognitionOutcome, ASingleHypothesisOfUnknownConfidenceIsAccepted) {
    EXPECT_EQ(Recognition::OutcomeAccepted, outcomeOf({-1.0F}));
}

TEST(RecognitionOutcome, SeveralHypothesesOfUnknownConfidenceAreRejected) {
    EXPECT_EQ(Recognition::OutcomeRejected, outcomeOf({-1.0F, -1.0F}));
    EXPECT_EQ(Recognition::OutcomeRejected, outcomeOf({-1.0F, 0.95F}));
}

TEST(RecognitionOutcome, UnknownConfidenceNeverReachesTheUpperThreshold) {
    EXPECT_EQ(Recognition::OutcomeUncertain,
              outcomeOf({-1.0F, -3.0F}, thresholds(-2.0F, 0.0F, -2.0F)));
}

TEST(RecognitionOutcome, AConfidenceThatIsNotANumberIsNeverAccepted) {
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({std::numeric_limits<float>::quiet_NaN()}));
}

TEST(RecognitionOutcome, AThresholdThatIsNotAFiniteNumberAcceptsNothing) {
    const float nan = std::numeric_limits<float>::quiet_NaN();
    const float infinity = std::numeric_limits<float>::infinity();
    for (const float odd : {nan, infinity}) {
        EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({1.0F}, thresholds(odd, 0.2F, 0.4F)));
        EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({1.0F}, thresholds(0.9F, odd, 0.4F)));
    }
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({0.0F}, thresholds(0.9F, 0.2F, nan)));
    EXPECT_EQ(Recognition::OutcomeUncertain, outcomeOf({1.0F}, thresholds(nan, nan, nan)));
}

TEST(Recognition, HoldsWhatItWasGiven) {
    const auto results = boost::make_shared<const RecognitionResults>(
        RecognitionResults{RecognitionResult("one", 0.5F), RecognitionResult("two", 0.25F)});
    const auto recognition =
        boost::make_shared<Recognition>(Recognition::OutcomeUncertain, results, "request");
    EXPECT_EQ(results, recognition->getResults());
    EXPECT_EQ(Recognition::OutcomeUncertain, recognition->getOutcome());
    EXPECT_EQ("request", recognition->getRequestId());
    EXPECT_EQ("two", recognition->getResults()->at(1).getText());
    EXPECT_EQ(0.25F, recognition->getResults()->at(1).getConfidence());
}
