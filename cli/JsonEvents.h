#pragma once

#include <nlohmann/json.hpp>
#include <ostream>
#include <string>

#include "EventPrinter.h"

namespace Cli {

/** Keeps its keys in the order in which they were added. */
using Json = nlohmann::ordered_json;

/** The shortest decimal that reads back as the same float: 0.85 instead of 0.8500000238. */
Json toJsonNumber(float value);

/** One line of JSON without a line feed. Bytes that are not UTF-8 become U+FFFD. */
std::string toJsonLine(const Json& value);

/** "rejected", "accepted" or "uncertain". */
const char* outcomeName(Talvox::Recognition::Outcome outcome);

/** Prints each event as one JSON object a line and flushes. */
class JsonEvents : public EventPrinter {
  public:
    explicit JsonEvents(std::ostream& output) : out(output) {}
    void print(const SessionEvent& event) override;

  private:
    std::ostream& out;
};

}  // namespace Cli
