#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdint>
#include <cstdio>
#include <limits>
#include <string>

#include "pal/kd_file.h"

namespace {

class File : public ::testing::Test {
  protected:
    void SetUp() override {
        std::string pattern = ::testing::TempDir() + "kdfileXXXXXX";
        ASSERT_NE(mkdtemp(&pattern[0]), nullptr);
        directory = pattern;
    }

    void TearDown() override {
        std::remove((directory + "/in.wav").c_str());
        rmdir(directory.c_str());
        kdMountKOR("/removable", nullptr);
    }

    std::string path() const { return directory + "/in.wav"; }

    std::string content() const {
        KDFile* const file = kdFopen(path().c_str(), "rb");
        std::string text(64, '\0');
        text.resize(kdFread(&text[0], 1, text.size(), file));
        EXPECT_EQ(kdFclose(file), 0);
        return text;
    }

    std::string directory;
};

TEST_F(File, IsWrittenPatchedAndReadBack) {
    KDFile* const file = kdFopen(path().c_str(), "wb");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(kdFwrite("0123456789", 1, 10, file), 10u);
    EXPECT_EQ(kdFseek(file, 2, KD_SEEK_SET), 0);
    EXPECT_EQ(kdFwrite("ab", 2, 1, file), 1u);
    EXPECT_EQ(kdFseek(file, 1, KD_SEEK_CUR), 0);
    EXPECT_EQ(kdFwrite("c", 1, 1, file), 1u);
    EXPECT_EQ(kdFseek(file, -1, KD_SEEK_END), 0);
    EXPECT_EQ(kdFwrite("z", 1, 1, file), 1u);
    EXPECT_EQ(kdFclose(file), 0);
    EXPECT_EQ(content(), "01ab4c678z");
}

TEST_F(File, ReadsWholeItemsOnly) {
    KDFile* const written = kdFopen(path().c_str(), "wb");
    EXPECT_EQ(kdFwrite("12345", 1, 5, written), 5u);
    EXPECT_EQ(kdFclose(written), 0);
    KDFile* const file = kdFopen(path().c_str(), "rb");
    char buffer[16];
    EXPECT_EQ(kdFread(buffer, 2, 8, file), 2u);
    EXPECT_EQ(kdFwrite("x", 1, 1, file), 0u);
    EXPECT_EQ(kdFclose(file), 0);
}

TEST_F(File, RefusesWhatCannotBeOpened) {
    EXPECT_EQ(kdFopen(path().c_str(), "rb"), nullptr);
    EXPECT_EQ(kdFopen((directory + "/none/in.wav").c_str(), "wb"), nullptr);
    EXPECT_EQ(kdFopen("", "rb"), nullptr);
    EXPECT_EQ(kdFopen(nullptr, "rb"), nullptr);
    EXPECT_EQ(kdFopen(path().c_str(), nullptr), nullptr);
}

void expectDead(KDFile* file) {
    char buffer[4] = "abc";
    EXPECT_EQ(kdFread(buffer, 1, 3, file), 0u);
    EXPECT_EQ(kdFwrite(buffer, 1, 3, file), 0u);
    EXPECT_EQ(kdFseek(file, 0, KD_SEEK_SET), -1);
    EXPECT_EQ(kdFclose(file), -1);
}

TEST_F(File, RefusesHandlesThatAreNotOpen) {
    expectDead(nullptr);
    int other = 0;
    expectDead(reinterpret_cast<KDFile*>(&other));
    KDFile* const file = kdFopen(path().c_str(), "wb");
    EXPECT_EQ(kdFclose(file), 0);
    expectDead(file);
}

TEST_F(File, StaleHandleDoesNotReachALaterFile) {
    KDFile* const first = kdFopen(path().c_str(), "wb");
    EXPECT_EQ(kdFclose(first), 0);
    KDFile* const second = kdFopen(path().c_str(), "wb");
    expectDead(first);
    EXPECT_EQ(kdFwrite("ok", 1, 2, second), 2u);
    EXPECT_EQ(kdFclose(second), 0);
    EXPECT_EQ(content(), "ok");
}

TEST_F(File, RefusesAbsurdArguments) {
    KDFile* const file = kdFopen(path().c_str(), "wb");
    EXPECT_EQ(kdFwrite(nullptr, 1, 1, file), 0u);
    EXPECT_EQ(kdFread(nullptr, 1, 1, file), 0u);
    EXPECT_EQ(kdFwrite("x", SIZE_MAX, 2, file), 0u);
    EXPECT_EQ(kdFwrite("x", 0, 5, file), 0u);
    EXPECT_EQ(kdFwrite("x", 5, 0, file), 0u);
    EXPECT_EQ(kdFseek(file, -1, KD_SEEK_SET), -1);
    EXPECT_EQ(kdFseek(file, 0, static_cast<KDfileSeekOrigin>(3)), -1);
    EXPECT_EQ(kdFclose(file), 0);
    EXPECT_EQ(content(), "");
}

TEST_F(File, AFullDeviceRefusesTheWrite) {
    KDFile* const file = kdFopen("/dev/full", "wb");
    if (file == nullptr) {
        GTEST_SKIP() << "no /dev/full";
    }
    EXPECT_EQ(kdFwrite("x", 1, 1, file), 0u);
    EXPECT_EQ(kdFclose(file), 0);
    expectDead(file);
}

TEST_F(File, VirtualRootIsNotMountedAtFirst) {
    EXPECT_EQ(kdFopen("/removable/in.wav", "wb"), nullptr);
    EXPECT_EQ(kdFopen("/removable", "rb"), nullptr);
}

TEST_F(File, MountedRootIsRedirectedUntilItIsUnmounted) {
    EXPECT_EQ(kdMountKOR("/removable", directory.c_str()), 0);
    KDFile* const file = kdFopen("/removable/in.wav", "wb");
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(kdFwrite("w", 1, 1, file), 1u);
    EXPECT_EQ(kdMountKOR("/removable", nullptr), 0);
    EXPECT_EQ(kdFwrite("w", 1, 1, file), 1u);
    EXPECT_EQ(kdFclose(file), 0);
    EXPECT_EQ(content(), "ww");
    EXPECT_EQ(kdFopen("/removable/in.wav", "rb"), nullptr);
}

TEST_F(File, RootsMatchWholeNamesAndTheLongestWins) {
    const std::string inner = directory + "/in";
    EXPECT_EQ(kdMountKOR(directory.c_str(), "/nowhere"), 0);
    EXPECT_EQ(kdFopen(path().c_str(), "wb"), nullptr);
    EXPECT_EQ(kdMountKOR(inner.c_str(), "/dev"), 0);
    KDFile* const null = kdFopen((inner + "/null").c_str(), "wb");
    EXPECT_NE(null, nullptr);
    EXPECT_EQ(kdFclose(null), 0);
    EXPECT_EQ(kdMountKOR(directory.c_str(), directory.c_str()), 0);
    KDFile* const file = kdFopen(path().c_str(), "wb");  // begins with the name of the inner root
    EXPECT_NE(file, nullptr);
    EXPECT_EQ(kdFclose(file), 0);
}

TEST_F(File, MountsAbsoluteRootsOnly) {
    EXPECT_EQ(kdMountKOR(nullptr, "/tmp"), -1);
    EXPECT_EQ(kdMountKOR("", "/tmp"), -1);
    EXPECT_EQ(kdMountKOR("removable", "/tmp"), -1);
    EXPECT_EQ(kdMountKOR("/removable/", "/tmp"), -1);
    EXPECT_EQ(kdMountKOR("/", "/tmp"), -1);
}

}  // namespace
