/**
 * @file
 * The faults that a session is put through.
 */
#pragma once

#include <functional>
#include <ostream>
#include <string>
#include <vector>

#include "FaultSession.h"

namespace FaultTest {

/** What a fault must come to in one mode of the session. */
struct Expected {
    std::string
        end; /**< the last event, with the words of results; "" where the mode is left out */
    std::size_t requests = 0; /**< that reach the server */
};

/** Hands of a fault: what it may do to the surroundings of a session. */
class Surroundings {
  public:
    virtual ~Surroundings() = default;

    virtual TestSupport::ScriptedHttpServer& gateway() = 0;
    virtual void say(TestSupport::Samples utterance) = 0;
    /** Calls this in each step, with the time since the session's start. */
    virtual void atEachStep(std::function<void(int64_t elapsedMs)> action) = 0;
    virtual void putUrl(const std::string& url) = 0;
};

/** One row of the catalogue. */
struct Fault {
    std::string name; /**< of the test */
    std::string what; /**< for the reader of the table */
    Expected simple;
    Expected chunked;
    std::function<void(Surroundings&)> arrange;
};

void PrintTo(const Fault& fault, std::ostream* out);

/** Faults of a kind, under a heading. */
struct Chapter {
    std::string heading;
    std::vector<Fault> faults;
};

const std::vector<Chapter>& getCatalogue();

// The chapters, each in a file of its own.
Chapter makeConnectionFaults();
Chapter makeAnswerFaults();
Chapter makeStatusFaults();
Chapter makeHeaderFaults();
Chapter makeDocumentFaults();
Chapter makeNetworkFaults();

/** How sessions end that go well, and that do not. */
extern const std::string WORDS;
extern const std::string NO_WORDS;
extern const std::string NETWORK_ERROR;

}  // namespace FaultTest
