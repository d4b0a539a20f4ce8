#include "libs/src/vad_layout.h"

#include <algorithm>
#include <cstring>
#include <iterator>

namespace {

constexpr int32_t INITIALISED = 42;
constexpr unsigned char PATTERN = 0xA5;

struct ModeTable {
    VadPerFrameLength overHangMax1;
    VadPerFrameLength overHangMax2;
    VadPerFrameLength individual;
    VadPerFrameLength total;
};

constexpr ModeTable MODE_TABLES[] = {
    {{{8, 4, 3}}, {{14, 7, 5}}, {{24, 21, 24}}, {{57, 48, 57}}},
    {{{8, 4, 3}}, {{14, 7, 5}}, {{37, 32, 37}}, {{100, 80, 100}}},
    {{{6, 3, 2}}, {{9, 5, 3}}, {{82, 78, 82}}, {{285, 260, 285}}},
    {{{6, 3, 2}}, {{9, 5, 3}}, {{94, 94, 94}}, {{1100, 1050, 1100}}},
};

/** Room for an instance that may turn out larger than its mirror. */
class ProbedCore {
  public:
    ProbedCore() { std::fill(std::begin(memory), std::end(memory), PATTERN); }

    VadCore* instance() { return reinterpret_cast<VadCore*>(memory); }

    VadCore contents() const {
        VadCore copy;
        std::memcpy(&copy, memory, sizeof copy);
        return copy;
    }

    bool isWrittenBehind() const {
        return std::any_of(std::begin(memory) + sizeof(VadCore), std::end(memory),
                           [](unsigned char byte) { return byte != PATTERN; });
    }

  private:
    alignas(16) unsigned char memory[4 * sizeof(VadCore)];
};

bool holds(const VadCore& core, const ModeTable& table) {
    return core.overHangMax1 == table.overHangMax1 && core.overHangMax2 == table.overHangMax2 &&
           core.individual == table.individual && core.total == table.total;
}

}  // namespace

const char* findVadLayoutFault(const VadCoreFunctions& functions) {
    ProbedCore probe;
    if (functions.init(probe.instance()) != 0) {
        return "the core does not initialise";
    }
    if (probe.contents().initFlag != INITIALISED) {
        return "the init flag is not where it is expected";
    }
    int mode = 0;
    for (const ModeTable& table : MODE_TABLES) {
        if (functions.setMode(probe.instance(), mode) != 0) {
            return "the core does not know one of the four modes";
        }
        if (!holds(probe.contents(), table)) {
            return "the table of a mode is not where it is expected";
        }
        ++mode;
    }
    if (probe.contents().initFlag != INITIALISED) {
        return "setting a mode changes the init flag";
    }
    return probe.isWrittenBehind() ? "the core's instance is larger than expected" : nullptr;
}
