#include "libs/src/vad_layout.h"

#include <gtest/gtest.h>

#include <cstring>

namespace {

struct Table {
    VadPerFrameLength overHangMax1;
    VadPerFrameLength overHangMax2;
    VadPerFrameLength individual;
    VadPerFrameLength total;
};

constexpr Table TABLES[] = {
    {{{8, 4, 3}}, {{14, 7, 5}}, {{24, 21, 24}}, {{57, 48, 57}}},
    {{{8, 4, 3}}, {{14, 7, 5}}, {{37, 32, 37}}, {{100, 80, 100}}},
    {{{6, 3, 2}}, {{9, 5, 3}}, {{82, 78, 82}}, {{285, 260, 285}}},
    {{{6, 3, 2}}, {{9, 5, 3}}, {{94, 94, 94}}, {{1100, 1050, 1100}}},
};

/** Writes into the instance as memory, so that it may also write beside the mirror. */
template <typename Value>
void write(VadCore* core, std::size_t offset, const Value& value) {
    std::memcpy(reinterpret_cast<unsigned char*>(core) + offset, &value, sizeof value);
}

int init(VadCore* core) {
    write(core, offsetof(VadCore, initFlag), int32_t{42});
    return 0;
}

int setMode(VadCore* core, int mode) {
    const Table& table = TABLES[mode];
    write(core, offsetof(VadCore, overHangMax1), table.overHangMax1);
    write(core, offsetof(VadCore, overHangMax2), table.overHangMax2);
    write(core, offsetof(VadCore, individual), table.individual);
    write(core, offsetof(VadCore, total), table.total);
    return 0;
}

TEST(VadLayout, AcceptsTheMirroredCore) {
    EXPECT_EQ(nullptr, findVadLayoutFault({init, setMode}));
}

TEST(VadLayout, FindsACoreThatDoesNotInitialise) {
    EXPECT_STREQ("the core does not initialise",
                 findVadLayoutFault({[](VadCore*) { return -1; }, setMode}));
}

TEST(VadLayout, FindsAMovedInitFlag) {
    const auto movedFlag = [](VadCore* core) {
        write(core, offsetof(VadCore, initFlag) - 4, int32_t{42});
        return 0;
    };
    EXPECT_STREQ("the init flag is not where it is expected",
                 findVadLayoutFault({movedFlag, setMode}));
}

TEST(VadLayout, FindsAMissingMode) {
    const auto threeModes = [](VadCore* core, int mode) {
        return mode < 3 ? setMode(core, mode) : -1;
    };
    EXPECT_STREQ("the core does not know one of the four modes",
                 findVadLayoutFault({init, threeModes}));
}

TEST(VadLayout, FindsATableThatDiffersInOneModeOnly) {
    const auto otherThreshold = [](VadCore* core, int mode) {
        setMode(core, mode);
        if (mode == 3) {
            write(core, offsetof(VadCore, total) + 4, int16_t{1101});
        }
        return 0;
    };
    EXPECT_STREQ("the table of a mode is not where it is expected",
                 findVadLayoutFault({init, otherThreshold}));
}

TEST(VadLayout, FindsSwappedTables) {
    const auto swapped = [](VadCore* core, int mode) {
        setMode(core, mode);
        write(core, offsetof(VadCore, individual), TABLES[mode].total);
        write(core, offsetof(VadCore, total), TABLES[mode].individual);
        return 0;
    };
    EXPECT_STREQ("the table of a mode is not where it is expected",
                 findVadLayoutFault({init, swapped}));
}

TEST(VadLayout, FindsALargerInstance) {
    const auto larger = [](VadCore* core) {
        write(core, sizeof(VadCore) + 100, int32_t{0});
        return init(core);
    };
    EXPECT_STREQ("the core's instance is larger than expected",
                 findVadLayoutFault({larger, setMode}));
}

TEST(VadLayout, FindsAModeThatOverwritesTheFlag) {
    const auto overwriting = [](VadCore* core, int mode) {
        setMode(core, mode);
        write(core, offsetof(VadCore, initFlag), int32_t{mode});
        return 0;
    };
    EXPECT_STREQ("setting a mode changes the init flag", findVadLayoutFault({init, overwriting}));
}

}  // namespace
