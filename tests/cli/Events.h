#pragma once

#include <boost/make_shared.hpp>
#include <string>
#include <utility>

#include "cli/EventPrinter.h"

namespace TestSupport {

inline Cli::SessionEvent event(Cli::SessionEvent::Kind kind, int64_t ms) {
    Cli::SessionEvent made;
    made.kind = kind;
    made.ms = ms;
    return made;
}

inline Cli::SessionEvent power(int64_t ms, float levelDb) {
    Cli::SessionEvent made = event(Cli::SessionEvent::POWER, ms);
    made.levelDb = levelDb;
    return made;
}

inline Cli::SessionEvent failure(int64_t ms, int code, const std::string& reason = "") {
    Cli::SessionEvent made = event(Cli::SessionEvent::FAILURE, ms);
    made.errorCode = code;
    made.reason = reason;
    return made;
}

inline Cli::SessionEvent results(int64_t ms, Talvox::Recognition::Outcome outcome,
                                 Talvox::RecognitionResults hypotheses,
                                 const std::string& requestId) {
    Cli::SessionEvent made = event(Cli::SessionEvent::RESULTS, ms);
    made.recognition = boost::make_shared<Talvox::Recognition>(
        outcome, boost::make_shared<const Talvox::RecognitionResults>(std::move(hypotheses)),
        requestId);
    return made;
}

}  // namespace TestSupport
