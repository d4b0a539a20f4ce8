// Servers of the system that fall silent: a sound server that is stopped, a name server without a
// word.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <string>

#include "Application.h"
#include "support/PulseServer.h"
#include "support/ScratchDirectory.h"

namespace {

using TearDown::Application;
using TearDown::Timing;
using TearDown::Words;

const int RUNS = 5;

class FrozenSoundServer : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!server.isRunning()) {
            GTEST_SKIP() << "no PulseAudio server: " << server.getOutput();
        }
        ASSERT_EQ(::mkfifo(go.c_str(), 0600), 0);
    }

    /** Freezes the server when the application is ready, and lets the application end then. */
    void endWhileFrozen(const Words& words, Timing& timing) {
        Application application(Application::makeCommand(words));
        EXPECT_TRUE(application.waitUntilReady());
        server.freeze();
        const int opened = ::open(go.c_str(), O_RDWR | O_CLOEXEC);
        application.finish(timing);
        ::close(opened);
        server.thaw();
    }

    void measure(const std::string& end, const Words& more) {
        Timing timing("sound server frozen in mid-recording | " + end);
        Words words = {"gateway=body", "mode=chunked", "recorder=pulse", "go=" + go, "end=" + end};
        words.insert(words.end(), more.begin(), more.end());
        for (int i = 0; i < RUNS; ++i) {
            endWhileFrozen(words, timing);
        }
        timing.expectBounded(end == "return" ? TearDown::PROCESS_FACTOR : 1);
    }

    TestSupport::PulseServer server;
    TestSupport::ScratchDirectory directory;
    const std::string go = directory.path("go");
};

TEST_F(FrozenSoundServer, DelaysNoRelease) {
    measure("release", {"repeat=1"});
}

TEST_F(FrozenSoundServer, DelaysNoCancel) {
    measure("cancel", {"repeat=1"});
}

TEST_F(FrozenSoundServer, DelaysNoDestructionOfEverything) {
    measure("destroy", {"repeat=1"});
}

TEST_F(FrozenSoundServer, DelaysNoEndOfTheProcess) {
    measure("return", {});
}

TEST_F(FrozenSoundServer, DelaysNoEndOfTheProcessThatConnectsToIt) {
    Timing timing("sound server frozen before the connection | return");
    server.freeze();
    for (int i = 0; i < RUNS; ++i) {
        Application(Application::makeCommand({"gateway=none", "recorder=pulse", "end=return"}))
            .finish(timing);
    }
    timing.expectBounded(TearDown::PROCESS_FACTOR);
}

/** The C library's own resolver asks a real socket, in a network and with a file of its own. */
class SilentNameServer : public ::testing::Test {
  protected:
    void SetUp() override {
        Words probe = makeLauncher();
        probe.emplace_back("true");
        const auto result = TestSupport::ChildProcess::run(probe);
        if (result.exitStatus != 0) {
            GTEST_SKIP() << "no network namespace: " << result.output;
        }
    }

    Words makeLauncher() const {
        return {"unshare",
                "--user",
                "--map-root-user",
                "--mount",
                "--net",
                "sh",
                "-c",
                "mount --bind " + settings + " /etc/resolv.conf && exec \"$0\" \"$@\""};
    }

    void measure(const std::string& end, const Words& more) {
        Timing timing("name server silent, real resolver | " + end);
        Words words = {"gateway=real", "mode=chunked", "nameserver=127.0.0.53", "end=" + end};
        words.insert(words.end(), more.begin(), more.end());
        Words command = makeLauncher();
        const Words application = Application::makeCommand(words);
        command.insert(command.end(), application.begin(), application.end());
        for (int i = 0; i < RUNS; ++i) {
            Application(command).finish(timing);
        }
        timing.expectBounded(end == "return" ? TearDown::PROCESS_FACTOR : 1);
    }

    TestSupport::ScratchDirectory directory;
    const std::string settings = directory.write("resolv.conf", "nameserver 127.0.0.53\n");
};

TEST_F(SilentNameServer, DelaysNoRelease) {
    measure("release", {"repeat=1"});
}

TEST_F(SilentNameServer, DelaysNoDestructionOfEverything) {
    measure("destroy", {"repeat=1"});
}

TEST_F(SilentNameServer, DelaysNoEndOfTheProcess) {
    measure("return", {});
}

TEST(Unload, IsNotDelayedAndLeavesThreadsThatHangTheirCode) {
    Timing timing("recorder and name server hang | dlclose");
    const TestSupport::ScratchDirectory directory;
    const std::string fifo = directory.path("client.conf");
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0);
    for (int i = 0; i < RUNS; ++i) {
        Application({TEARDOWN_HOST, TEARDOWN_PLUGIN, fifo}).finish(timing);
    }
    timing.expectBounded();
}

}  // namespace
