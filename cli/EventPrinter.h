#pragma once

#include <boost/shared_ptr.hpp>
#include <cstdint>
#include <string>

#include "talvox/Recognition.h"

namespace Cli {

/** What happened in a session, and when. */
struct SessionEvent {
    enum Kind { RECORDING_BEGIN, SPEAKING_BEGIN, POWER, RECORDING_DONE, RESULTS, FAILURE };

    Kind kind = RECORDING_BEGIN;
    int64_t ms = 0;         /**< since the session's start */
    float levelDb = 0;      /**< of POWER */
    bool isSilence = false; /**< of POWER: every sample of the buffer is zero */
    int errorCode = 0;      /**< of FAILURE: a code of `Talvox::SpeechError` */
    std::string reason;     /**< of FAILURE: why, for the reader; empty if that is unknown */
    boost::shared_ptr<Talvox::Recognition> recognition; /**< of RESULTS; not null there */

    /** The session's last event. */
    bool isTerminal() const { return kind == RESULTS || kind == FAILURE; }
};

/** Shows the events of a session; called by one thread, in the order in which they happened. */
class EventPrinter {
  public:
    virtual ~EventPrinter() = default;
    virtual void print(const SessionEvent& event) = 0;
};

}  // namespace Cli
