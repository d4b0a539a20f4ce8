#pragma once

#include <cstddef>
#include <string>

namespace Cli {

/** "20 s", "1.5 s" */
std::string secondsText(double ms);

/** "160 ms" */
std::string msText(double ms);

/** "1 day", "82 days" */
std::string daysText(long days);

/** Bytes in units of 1,048,576: "1 MB", "1.69 MB" */
std::string megabytesText(std::size_t bytes);

/** The first line of an answer's body, as it may be shown. */
std::string firstLine(const std::string& body);

}  // namespace Cli
