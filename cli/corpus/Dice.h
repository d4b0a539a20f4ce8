#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

namespace Cli {

/**
 * Random numbers that a seed determines everywhere: the generator is ours, because the standard
 * library's distributions differ between implementations.
 */
class Dice {
  public:
    explicit Dice(uint64_t seed) : state_(seed) {}

    /** A seed for a purpose of its own: numbers drawn for one do not shift those of another. */
    static uint64_t derive(uint64_t seed, const std::string& purpose) {
        Dice dice(seed);
        uint64_t derived = dice.next();
        for (const char character : purpose) {
            dice.state_ ^= static_cast<unsigned char>(character);
            derived = dice.next();
        }
        return derived;
    }

    uint64_t next() {
        state_ += 0x9E3779B97F4A7C15U;
        uint64_t mixed = state_;
        mixed = (mixed ^ (mixed >> 30U)) * 0xBF58476D1CE4E5B9U;
        mixed = (mixed ^ (mixed >> 27U)) * 0x94D049BB133111EBU;
        return mixed ^ (mixed >> 31U);
    }

    /** A number below `count`, which is not 0. */
    std::size_t below(std::size_t count) { return static_cast<std::size_t>(next() % count); }

    /** A number from -1 to 1. */
    double uniform() { return static_cast<double>(next() >> 11U) / 4503599627370496.0 - 1; }

    /** A number with a nearly normal distribution and a variance of 1. */
    double normal() {
        double sum = 0;
        for (int part = 0; part < 3; ++part) {
            sum += uniform();
        }
        return sum;
    }

  private:
    uint64_t state_;
};

}  // namespace Cli
