#pragma once

#include <cstddef>
#include <string>
#include <vector>

namespace Cli {

/** One axis of a grid: a parameter of the detector and its values as they are written. */
struct GridAxis {
    std::string name;
    std::vector<std::string> values;
};

/** The most points that a grid may have. */
const std::size_t GRID_POINTS_MAX = 20000;

/**
 * Reads a grid such as "analyzems=800:1500:100;activityoff=.1:.3:.05;aggressiveness=1,2,3": for
 * each parameter a range (first, last, step), or values separated by commas. Ranges are counted in
 * decimals, so that the last value is met exactly.
 * @throws UsageError if the text is malformed or has more than `GRID_POINTS_MAX` points
 */
std::vector<GridAxis> parseGrid(const std::string& text);

/** The parameter texts of all points; the last axis varies fastest. */
std::vector<std::string> gridPoints(const std::vector<GridAxis>& axes);

}  // namespace Cli
