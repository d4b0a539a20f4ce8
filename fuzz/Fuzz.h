/**
 * @file
 * What the fuzz targets share.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

/** Makes a broken invariant a finding. Called once, before the first input. Returns 0. */
extern "C" int LLVMFuzzerInitialize(int* argc, char*** argv);

/** The body of each target: runs one input. Returns 0; a finding aborts the process. */
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, std::size_t size);

namespace Fuzz {

/** Gives the bytes of an input out, front to back; once they are used up, zeroes. */
class Input {
  public:
    Input(const uint8_t* data, std::size_t size);

    bool isEmpty() const { return position == bytes.size(); }

    uint8_t takeByte();
    /** 32 bits, little-endian. */
    uint32_t takeWord();
    /** @return a number below `bound`, which is 1 to 256 */
    std::size_t takeBelow(std::size_t bound);
    /** One byte says how many follow. */
    std::string takeText();
    /** Everything before the next line feed, which is taken as well. */
    std::string takeLine();
    std::string takeRest();

  private:
    const std::string bytes;
    std::size_t position = 0;
};

/** A finding: says what does not hold and aborts. */
[[noreturn]] void fail(const char* what);

/** A finding unless `holds`. */
inline void require(bool holds, const char* what) {
    if (!holds) {
        fail(what);
    }
}

/** Keeps the log off standard error while it lives, but reads every byte of it. */
class QuietLog {
  public:
    QuietLog();
    ~QuietLog();
    QuietLog(const QuietLog&) = delete;
    QuietLog& operator=(const QuietLog&) = delete;
};

}  // namespace Fuzz
