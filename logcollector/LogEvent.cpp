#include "logcollector/LogEvent.h"

#include "core/Logger.h"
#include "pal/kd_time.h"

namespace LogCollector {

const std::string LogEvent::TAG("LogEvent");

const std::string LogEvent::eventTypesDescriptions[2] = {"event", "error"};

LogEvent::LogEvent(EventType eventType, const std::string& eventName)
    : LogEvent(eventType, eventName, Params()) {}

LogEvent::LogEvent(EventType eventType, const std::string& eventName, const Params& eventParams)
    : type(eventType), name(eventName), timestamp(kdGetTimeUST()), params(eventParams) {}

LogEvent::LogEvent(std::istream& /*stream*/) {}

LogEvent::~LogEvent() = default;

void LogEvent::addParam(const std::string& paramName, const std::string& value) {
    const auto known = params.find(paramName);
    if (known != params.end()) {
        Logger::log(Logger::PROBLEM, "%s: parameter %swill be overwrited", TAG.c_str(),
                    paramName.c_str());
        known->second = value;
    } else {
        params.emplace(paramName, value);
    }
}

}  // namespace LogCollector
