#pragma once

#include <cstddef>
#include <map>
#include <string>

/** The session of all records. */
const char* const KILLED_SESSION = "killed";

/** The parameters of record `number`: each number has its own text. */
inline std::map<std::string, std::string> paramsOfKilled(int number) {
    const auto size = static_cast<std::size_t>(number * 7 % 400);
    return {{"number", std::to_string(number)},
            {"text", std::string(size, static_cast<char>('a' + number % 26))}};
}
