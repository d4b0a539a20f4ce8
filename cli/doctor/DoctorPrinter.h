#pragma once

#include <ostream>
#include <string>
#include <vector>

#include "Check.h"

namespace Cli {

/** Prints a check as one line, and its advice as another. */
void printCheck(const Check& check, std::ostream& out);

/** All checks as one JSON object. */
std::string checksJson(const std::string& url, const std::vector<Check>& checks);

/** Whether every check that applies was made and found nothing. */
bool isAllWell(const std::vector<Check>& checks);

}  // namespace Cli
