/**
 * @file
 * The tables of docs/TORTURE.md.
 */
#pragma once

#include <map>
#include <string>

#include "Campaign.h"

namespace Torture {

/** Replaces the part of the document between its two marks. @throws std::runtime_error */
void writeDocument(const std::string& path, const std::map<Campaign::Key, Cell>& cells);

/**
 * Compares names in the document with those of the program: kinds, sessions, exclusions, and what
 * is left out.
 * @return the first difference; empty when there is none
 */
std::string findDifference(const std::string& path);

}  // namespace Torture
