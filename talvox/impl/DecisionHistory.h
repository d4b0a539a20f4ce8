/**
 * @file
 * A sliding history of yes-or-no decisions.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace Talvox {

/**
 * A fixed number of bits; each new one pushes out the oldest. Pushing costs the same whatever the
 * length, and counting looks at no more than was pushed, so that an absurdly long history does not
 * slow a session down.
 */
class DecisionHistory {
  public:
    std::size_t size() const { return length; }

    /** Cuts the history at its newest end, or extends it there with zeroes. */
    void resize(std::size_t newLength);

    /** Appends a decision and drops the oldest one; does nothing while the length is 0. */
    void push(bool decision);

    /** @param index 0 for the oldest, less than `size()` */
    bool at(std::size_t index) const;

    /** How many of the `count` newest decisions (of all, where there are fewer) are true. */
    std::size_t countNewest(std::size_t count) const;

    /** "1" and "0", oldest first, of the `count` newest decisions (of all, where there are fewer).
     */
    std::string toString(std::size_t count) const;

  private:
    std::size_t countStored(std::size_t begin, std::size_t end) const;

    std::vector<uint64_t> words;
    std::size_t length = 0;
    std::size_t oldest = 0;
    /** How many of the newest may be true; those before them have never been set. */
    std::size_t decided = 0;
};

}  // namespace Talvox
