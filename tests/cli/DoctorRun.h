#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace TestSupport {

/** What `talvox doctor --json` found. */
struct DoctorResult {
    int status = -1;
    std::string output; /**< a JSON object */

    /** The whole report; discarded if the output is no JSON. */
    nlohmann::json report() const;
    /** The check of this name; an empty object if it was not made. */
    nlohmann::json check(const std::string& name) const;
    std::string verdict(const std::string& name) const;
    /** Finding and advice, with a line end between. */
    std::string words(const std::string& name) const;
    /** The names of the checks, with blanks between. */
    std::string names() const;
};

/** Runs the doctor; `more` follows the address. */
DoctorResult runDoctor(const std::string& url, const std::vector<std::string>& more);

}  // namespace TestSupport
