#include "Fuzz.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "pal/kd_log.h"
#include "support/AbortOnAssertion.h"

// libFuzzer calls this before the first input.
extern "C" int LLVMFuzzerInitialize(int* /*argc*/, char*** /*argv*/) {
    TestSupport::abortOnAssertion();
    return 0;
}

namespace Fuzz {

namespace {

void receive(const char* message, void* /*user*/) {
    static volatile std::size_t seen = 0;
    seen = seen + std::strlen(message);
}

}  // namespace

Input::Input(const uint8_t* data, std::size_t size)
    : bytes(size > 0 ? std::string(reinterpret_cast<const char*>(data), size) : std::string()) {}

uint8_t Input::takeByte() {
    return isEmpty() ? uint8_t{0} : static_cast<uint8_t>(bytes[position++]);
}

uint32_t Input::takeWord() {
    uint32_t word = 0;
    for (unsigned shift = 0; shift < 32; shift += 8) {
        word |= static_cast<uint32_t>(takeByte()) << shift;
    }
    return word;
}

std::size_t Input::takeBelow(std::size_t bound) {
    return takeByte() % bound;
}

std::string Input::takeText() {
    const std::size_t wanted = takeByte();
    const std::size_t count = std::min(wanted, bytes.size() - position);
    position += count;
    return bytes.substr(position - count, count);
}

std::string Input::takeLine() {
    const std::size_t end = std::min(bytes.find('\n', position), bytes.size());
    std::string line = bytes.substr(position, end - position);
    position = std::min(end + 1, bytes.size());
    return line;
}

std::string Input::takeRest() {
    std::string rest = bytes.substr(position);
    position = bytes.size();
    return rest;
}

void fail(const char* what) {
    std::fprintf(stderr, "finding: this does not hold: %s\n", what);
    std::abort();
}

QuietLog::QuietLog() {
    kdSetLogSinkKOR(&receive, nullptr);
}

QuietLog::~QuietLog() {
    kdSetLogSinkKOR(nullptr, nullptr);
}

}  // namespace Fuzz
