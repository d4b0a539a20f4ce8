/**
 * @file
 * What a listener receives at the end of a recognition.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "talvox/Export.h"
#include "talvox/RecognitionResult.h"
#include "talvox/Settings.h"

namespace Talvox {

/** Hypotheses, the engine's verdict on them and the identifier of the request; constant. */
class TALVOX_API Recognition {
  public:
    /** The verdict; the numbers are fixed. */
    enum Outcome {
        OutcomeRejected = 0, /**< treat as nothing recognised */
        OutcomeAccepted = 1, /**< use the best hypothesis without asking */
        OutcomeUncertain = 2 /**< let the user choose */
    };

    /**
     * @param hypotheses  best first; not null; shared, not copied
     * @param request     identifier of the service request; empty where there was none
     */
    Recognition(Outcome verdict, boost::shared_ptr<const RecognitionResults> hypotheses,
                std::string request);

    /**
     * Judges hypotheses by the thresholds "upperconfidence", "winnerleadconfidence" and
     * "lowerconfidence".
     */
    static Outcome decideOutcome(const RecognitionResults& hypotheses, const Settings& settings);

    /** As given to the constructor. */
    const boost::shared_ptr<const RecognitionResults>& getResults() const { return results; }
    Outcome getOutcome() const { return outcome; }
    const std::string& getRequestId() const { return requestId; }

  private:
    boost::shared_ptr<const RecognitionResults> results;
    Outcome outcome;
    std::string requestId;
};

}  // namespace Talvox
