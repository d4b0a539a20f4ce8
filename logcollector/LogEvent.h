/**
 * @file
 * One usage event.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <istream>
#include <map>
#include <string>

#include "talvox/Export.h"

namespace LogCollector {

/** What happened, when, and its parameters. Not synchronised; belongs to its maker until sent. */
class TALVOX_API LogEvent {
  public:
    /** The numbers are fixed. */
    enum EventType { event = 0, error = 1 };

    /** Values by their names. */
    using Params = std::map<std::string, std::string>;

    /** How the lines of events in the log begin. */
    static const std::string TAG;

    /** The words of the types in records. */
    static const std::string eventTypesDescriptions[2];

    /** An event of this moment, by the platform clock. Any bytes in name and parameters. */
    LogEvent(EventType eventType, const std::string& eventName);
    LogEvent(EventType eventType, const std::string& eventName, const Params& eventParams);

    /** An event without name, parameters and time; nothing is read from the stream. */
    explicit LogEvent(std::istream& stream);

    virtual ~LogEvent();

    /** Adds a parameter; an earlier value of that name is replaced, with a line in the log. */
    void addParam(const std::string& paramName, const std::string& value);

    /** As given to the constructor. */
    EventType getType() const { return type; }
    const std::string& getName() const { return name; }

    /** The platform clock in nanoseconds when the event was made. */
    int64_t getTimestamp() const { return timestamp; }

    /** The parameters in ascending byte order of their names. */
    Params::const_iterator getParamsIterator() const { return params.begin(); }
    Params::const_iterator getParamsEndIterator() const { return params.end(); }
    std::size_t getParamsCount() const { return params.size(); }

  private:
    EventType type = event;
    std::string name;
    int64_t timestamp = 0;
    Params params;
};

}  // namespace LogCollector
