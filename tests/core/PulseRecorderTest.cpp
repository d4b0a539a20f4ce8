#include <dlfcn.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <sys/un.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <boost/make_shared.hpp>
#include <boost/weak_ptr.hpp>
#include <chrono>
#include <climits>
#include <condition_variable>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <functional>
#include <mutex>
#include <string>
#include <system_error>
#include <vector>

#include "core/sound/Recorder.h"
#include "core/util/EventLock.h"
#include "core/util/Singleton.h"
#include "pal/kd_event.h"
#include "pal/kd_time.h"
#include "support/LogCapture.h"
#include "support/PulseServer.h"
#include "support/TestSound.h"
#include "support/Threads.h"

namespace {

using Sound::Recorder;
using Sound::SoundDataBuffer;
using std::chrono::steady_clock;
using TestSupport::Samples;
using Util::EventLock;

/** Turns of the audio loop until one fails; below 1 for none. */
std::atomic<int> turnsUntilFailure{0};

const KDint64 NS_PER_SECOND = 1000000000;
const std::chrono::seconds WAIT_MAX(20);

/** The audio loop's turns before the server is ready, at most. */
constexpr int TURNS_OF_A_HANDSHAKE = 15;

/** Collects what a recorder delivers and lets the test wait for it. */
class Collector : public Sound::RecorderListener {
  public:
    void onRecorderDataReceived(Recorder* recorder,
                                boost::shared_ptr<const SoundDataBuffer> buffer) override {
        EXPECT_EQ(kdHoldsEventLockKOR(), 1);
        EXPECT_EQ(errors, 0);
        {
            const std::lock_guard<std::mutex> lock(mutex);
            ++bufferCount;
            sizes.push_back(buffer->getData().size());
            bytes.insert(bytes.end(), buffer->getData().begin(), buffer->getData().end());
        }
        changed.notify_all();
        if (onData) {
            onData(recorder);
        }
    }

    void onRecorderError(Recorder* recorder) override {
        EXPECT_EQ(kdHoldsEventLockKOR(), 1);
        {
            const std::lock_guard<std::mutex> lock(mutex);
            ++errors;
            errorTime = steady_clock::now();
        }
        changed.notify_all();
        if (onError) {
            onError(recorder);
        }
    }

    bool waitForBuffers(int count) {
        return waitUntil([this, count] { return bufferCount >= count; });
    }
    bool waitForError() {
        return waitUntil([this] { return errors > 0; });
    }
    bool waitForBytes(const std::vector<unsigned char>& wanted) {
        return waitUntil([this, &wanted] {
            return std::search(bytes.begin(), bytes.end(), wanted.begin(), wanted.end()) !=
                   bytes.end();
        });
    }

    int getBufferCount() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return bufferCount;
    }
    int getErrorCount() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return errors;
    }
    std::vector<std::size_t> getSizes() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return sizes;
    }
    steady_clock::time_point getErrorTime() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return errorTime;
    }

    std::function<void(Recorder*)> onData;
    std::function<void(Recorder*)> onError;

  private:
    template <typename Condition>
    bool waitUntil(Condition condition) {
        std::unique_lock<std::mutex> lock(mutex);
        return changed.wait_for(lock, WAIT_MAX, condition);
    }

    mutable std::mutex mutex;
    std::condition_variable changed;
    int bufferCount = 0;
    int errors = 0;
    std::vector<std::size_t> sizes;
    std::vector<unsigned char> bytes;
    steady_clock::time_point errorTime;
};

}  // namespace

// Stands before the sound client's function.
#pragma GCC visibility push(default)
extern "C" int pa_mainloop_iterate(void* loop, int block, int* result) {
    if (turnsUntilFailure > 0 && --turnsUntilFailure == 0) {
        return -1;
    }
    using Iterate = int(void*, int, int*);
    return reinterpret_cast<Iterate*>(dlsym(RTLD_NEXT, "pa_mainloop_iterate"))(loop, block, result);
}
#pragma GCC visibility pop

namespace {

/** Removes a directory to which an audio thread may add while that is done. */
void remove(const TestSupport::ScratchDirectory& directory) {
    std::error_code ignored;
    while (std::filesystem::exists(directory.path(""), ignored)) {
        std::filesystem::remove_all(directory.path(""), ignored);
    }
}

/** A recorder of the platform's kind. Every use of it is under the event lock. */
class PulseRecorderTest : public ::testing::Test {
  protected:
    ~PulseRecorderTest() override {
        {
            const EventLock lock;
            recorder.reset();
        }
        kdDrainEventsKOR();
        // Waits for the audio threads, before the environment changes under them.
        Util::SingletonStorage::destroyAll();
    }

    void make() {
        const EventLock lock;
        recorder = Recorder::createRecorder();
        recorder->addListener(listener);
    }

    bool init() {
        const EventLock lock;
        return recorder->init();
    }

    void start() {
        const EventLock lock;
        recorder->startRecording();
    }

    void stop() {
        const EventLock lock;
        recorder->stopRecording();
    }

    bool isRecording() {
        const EventLock lock;
        return recorder->isRecording();
    }

    TestSupport::LogCapture log;
    boost::shared_ptr<Collector> listener = boost::make_shared<Collector>();
    boost::shared_ptr<Recorder> recorder;
};

// Without a server.

class PulseRecorderWithoutServer : public PulseRecorderTest {
  protected:
    ~PulseRecorderWithoutServer() override {
        // The base waits once more; the environment goes in between.
        {
            const EventLock lock;
            recorder.reset();
        }
        Util::SingletonStorage::destroyAll();
    }

    TestSupport::ScratchDirectory directory;
    TestSupport::PulseEnvironment environment{directory, "unix:" + directory.path("nobody.sock")};
};

TEST_F(PulseRecorderWithoutServer, ReportsAnErrorPromptly) {
    make();
    EXPECT_TRUE(init());
    const auto begin = steady_clock::now();
    start();
    ASSERT_TRUE(listener->waitForError());
    EXPECT_LT(listener->getErrorTime() - begin, std::chrono::seconds(1));
    EXPECT_FALSE(isRecording());
    EXPECT_EQ(listener->getBufferCount(), 0);
    EXPECT_TRUE(
        log.contains("PulseRecorder: no connection to the sound server: Connection refused"));
    kdDrainEventsKOR();
    EXPECT_EQ(listener->getErrorCount(), 1);
}

TEST_F(PulseRecorderWithoutServer, ReportsNothingBeforeTheStart) {
    make();
    EXPECT_TRUE(init());
    // The end of the audio thread says that the failure is known.
    Util::SingletonStorage::destroyAll();
    kdDrainEventsKOR();
    EXPECT_EQ(listener->getErrorCount(), 0);
    start();
    EXPECT_TRUE(listener->waitForError());
}

TEST_F(PulseRecorderWithoutServer, ReportsNothingAfterTheStop) {
    make();
    {
        const EventLock lock;
        EXPECT_TRUE(recorder->init());
        recorder->startRecording();
        recorder->stopRecording();
    }
    Util::SingletonStorage::destroyAll();
    kdDrainEventsKOR();
    EXPECT_EQ(listener->getErrorCount(), 0);
}

TEST_F(PulseRecorderWithoutServer, ReportsTheErrorOfEveryStart) {
    make();
    for (int i = 1; i <= 3; ++i) {
        start();
        kdDrainEventsKOR();
        ASSERT_TRUE(listener->waitForError());
        EXPECT_FALSE(isRecording());
        EXPECT_EQ(listener->getErrorCount(), 1);
        listener = boost::make_shared<Collector>();
        const EventLock lock;
        recorder->addListener(listener);
    }
}

TEST_F(PulseRecorderWithoutServer, RefusesAnAbsurdFormat) {
    const EventLock lock;
    for (const int rate : {INT_MIN, -1, 0, 999, 384001, INT_MAX}) {
        const boost::shared_ptr<Recorder> refused = Recorder::createRecorder();
        refused->setSampleRate(rate);
        EXPECT_FALSE(refused->init()) << rate;
    }
    for (const int length : {INT_MIN, -1, 0, 10001, INT_MAX}) {
        const boost::shared_ptr<Recorder> refused = Recorder::createRecorder();
        refused->setBufferLength(length);
        EXPECT_FALSE(refused->init()) << length;
    }
}

TEST_F(PulseRecorderWithoutServer, StartInSpiteOfARefusedInitReportsAnError) {
    make();
    recorder->setSampleRate(0);
    EXPECT_FALSE(init());
    start();
    EXPECT_TRUE(listener->waitForError());
    EXPECT_TRUE(log.contains("PulseRecorder: unusable sample rate or buffer length"));
}

TEST_F(PulseRecorderWithoutServer, RecordersThatAreGoneReportNothing) {
    const boost::weak_ptr<Sound::RecorderListener> weakListener = listener;
    for (int i = 0; i < 20; ++i) {
        const EventLock lock;
        const boost::shared_ptr<Recorder> brief = Recorder::createRecorder();
        brief->addListener(weakListener);
        EXPECT_TRUE(brief->init());
        if (i % 2 == 0) {
            brief->startRecording();
        }
    }
    Util::SingletonStorage::destroyAll();
    kdDrainEventsKOR();
    EXPECT_EQ(listener->getErrorCount(), 0);
}

TEST_F(PulseRecorderWithoutServer, ProcessMayEndWhileAudioThreadsEnd) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    for (int i = 0; i < 5; ++i) {
        EXPECT_EXIT(
            {
                // One of them at least is between its last step and its end when the process ends.
                for (int n = 0; n < 50; ++n) {
                    make();
                    init();
                }
                alarm(20);
                remove(directory);
                std::exit(0);
            },
            ::testing::ExitedWithCode(0), "");
    }
}

// With a server that accepts the connection and never says a word.

class PulseRecorderWithMuteServer : public PulseRecorderTest {
  protected:
    PulseRecorderWithMuteServer() {
        server = socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sockaddr_un address = {};
        address.sun_family = AF_UNIX;
        const std::string path = directory.path("mute.sock");
        path.copy(address.sun_path, sizeof(address.sun_path) - 1);
        EXPECT_EQ(bind(server, reinterpret_cast<sockaddr*>(&address), sizeof(address)), 0);
        EXPECT_EQ(listen(server, 8), 0);
        kdUseManualClockKOR(0);
    }

    ~PulseRecorderWithMuteServer() override {
        {
            const EventLock lock;
            recorder.reset();
        }
        Util::SingletonStorage::destroyAll();
        kdUseRealClockKOR();
        close(server);
    }

    TestSupport::ScratchDirectory directory;
    TestSupport::PulseEnvironment environment{directory, "unix:" + directory.path("mute.sock")};
    int server = -1;
};

TEST_F(PulseRecorderWithMuteServer, ReportsAnErrorFiveSecondsAfterTheStart) {
    make();
    EXPECT_TRUE(init());
    start();
    kdAdvanceClockKOR(5 * NS_PER_SECOND - 1);
    EXPECT_EQ(listener->getErrorCount(), 0);
    kdAdvanceClockKOR(1);
    EXPECT_EQ(listener->getErrorCount(), 1);
    EXPECT_FALSE(isRecording());
    EXPECT_TRUE(log.contains("PulseRecorder: the device sends nothing"));
    kdAdvanceClockKOR(60 * NS_PER_SECOND);
    EXPECT_EQ(listener->getErrorCount(), 1);
}

TEST_F(PulseRecorderWithMuteServer, StopsAndGoesWithoutWaiting) {
    const auto begin = steady_clock::now();
    make();
    EXPECT_TRUE(init());
    start();
    stop();
    start();
    {
        const EventLock lock;
        recorder.reset();
    }
    EXPECT_LT(steady_clock::now() - begin, std::chrono::seconds(1));
    kdAdvanceClockKOR(60 * NS_PER_SECOND);
    EXPECT_EQ(listener->getErrorCount(), 0);
}

TEST_F(PulseRecorderWithMuteServer, ProcessMayEndWhileItRecords) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            make();
            init();
            start();
            static const boost::shared_ptr<Recorder> kept = recorder;
            // Asked before the address goes, to which the audio thread may not have come yet.
            const bool records = isRecording();
            // The end of the process leaves the fixture as it is.
            remove(directory);
            std::exit(records ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

// With a real server.

class PulseRecorderWithServer : public PulseRecorderTest {
  protected:
    void SetUp() override {
        if (!server.isRunning()) {
            GTEST_SKIP() << "no PulseAudio server: " << server.getOutput();
        }
    }

    ~PulseRecorderWithServer() override {
        {
            const EventLock lock;
            recorder.reset();
        }
        Util::SingletonStorage::destroyAll();
    }

    TestSupport::PulseServer server;
};

TEST_F(PulseRecorderWithServer, RecordsBitByBitInBuffersOfTheAskedLength) {
    // Nowhere zero, so that it cannot be found in silence, and never twice the same.
    Samples sound(4800);
    TestSupport::NoiseSource noise(7);
    for (int16_t& sample : sound) {
        sample = static_cast<int16_t>(static_cast<int>(noise.next() * 32000) | 1);
    }
    make();
    ASSERT_TRUE(init());
    start();
    ASSERT_TRUE(listener->waitForBuffers(1));
    ASSERT_TRUE(server.play(sound));
    EXPECT_TRUE(listener->waitForBytes(TestSupport::toBytes(sound, 0, sound.size())));
    stop();
    for (const std::size_t size : listener->getSizes()) {
        EXPECT_EQ(size, 3200U);
    }
    EXPECT_EQ(listener->getErrorCount(), 0);
}

TEST_F(PulseRecorderWithServer, RecordsAtOtherRatesAndLengths) {
    make();
    recorder->setSampleRate(11025);
    recorder->setBufferLength(30);
    ASSERT_TRUE(init());
    start();
    ASSERT_TRUE(listener->waitForBuffers(10));
    stop();
    for (const std::size_t size : listener->getSizes()) {
        EXPECT_EQ(size, 660U);
    }
}

TEST_F(PulseRecorderWithServer, TellsTheServerWhatTheRecordingIsFor) {
    for (const Recorder::Mode mode : {Recorder::MODE_VOICE_RECOGNITION, Recorder::MODE_GENERAL}) {
        listener = boost::make_shared<Collector>();
        make();
        recorder->setMode(mode);
        recorder->setBufferLength(20);
        ASSERT_TRUE(init());
        start();
        ASSERT_TRUE(listener->waitForBuffers(1));
        const std::string outputs = server.control({"list", "source-outputs"}).output;
        const bool voice = mode == Recorder::MODE_VOICE_RECOGNITION;
        EXPECT_EQ(outputs.find("media.role = \"phone\"") != std::string::npos, voice) << outputs;
        EXPECT_EQ(outputs.find("media.role = \"production\"") != std::string::npos, !voice);
        EXPECT_NE(outputs.find("s16le 1ch 16000Hz"), std::string::npos);
        stop();
    }
}

TEST_F(PulseRecorderWithServer, ReportsAKilledServerWithinASecond) {
    make();
    ASSERT_TRUE(init());
    start();
    ASSERT_TRUE(listener->waitForBuffers(2));
    const auto killed = steady_clock::now();
    server.kill();
    ASSERT_TRUE(listener->waitForError());
    EXPECT_LT(listener->getErrorTime() - killed, std::chrono::seconds(1));
    EXPECT_FALSE(isRecording());
    EXPECT_TRUE(log.containsPart("PulseRecorder: the sound server is gone: "));
    const int buffers = listener->getBufferCount();
    kdDrainEventsKOR();
    EXPECT_EQ(listener->getErrorCount(), 1);
    EXPECT_EQ(listener->getBufferCount(), buffers);
}

TEST_F(PulseRecorderWithServer, ReportsAKilledStreamWithinASecond) {
    make();
    ASSERT_TRUE(init());
    start();
    ASSERT_TRUE(listener->waitForBuffers(1));
    // With the last source the stream goes, because it cannot be moved to another one.
    server.control({"unload-module", "module-remap-source"});
    server.control({"unload-module", "module-null-sink"});
    const auto killed = steady_clock::now();
    ASSERT_TRUE(listener->waitForError());
    EXPECT_LT(listener->getErrorTime() - killed, std::chrono::seconds(1));
    EXPECT_EQ(listener->getErrorCount(), 1);
    EXPECT_TRUE(log.containsPart("PulseRecorder: the recording stream ended: "));
}

TEST_F(PulseRecorderWithServer, ReportsAServerThatFallsSilentWithinASecond) {
    kdUseManualClockKOR(0);
    make();
    ASSERT_TRUE(init());
    start();
    ASSERT_TRUE(listener->waitForBuffers(2));
    kdAdvanceClockKOR(NS_PER_SECOND / 5);
    server.freeze();
    // What the server sent before may still be on its way for one tick.
    kdAdvanceClockKOR(NS_PER_SECOND / 5);
    kdAdvanceClockKOR(NS_PER_SECOND);
    EXPECT_EQ(listener->getErrorCount(), 1);
    EXPECT_TRUE(log.contains("PulseRecorder: the device sends nothing"));
    kdUseRealClockKOR();
}

TEST_F(PulseRecorderWithServer, ReportsSoundThatIsNotTakenInTime) {
    make();
    recorder->setBufferLength(1);
    ASSERT_TRUE(init());
    listener->onData = [this](Recorder*) {
        // The event thread is busy once, while the sound of more than 64 buffers comes.
        listener->onData = nullptr;
        server.play(Samples(16000 / 5, 1));
    };
    start();
    ASSERT_TRUE(listener->waitForError());
    EXPECT_TRUE(log.contains("PulseRecorder: recorded sound was not taken in time"));
    EXPECT_FALSE(isRecording());
}

TEST_F(PulseRecorderWithServer, StopInsideACallbackIsTheLastCallback) {
    listener->onData = [](Recorder* notified) { notified->stopRecording(); };
    make();
    recorder->setBufferLength(1);
    ASSERT_TRUE(init());
    start();
    ASSERT_TRUE(listener->waitForBuffers(1));
    Util::SingletonStorage::destroyAll();
    kdDrainEventsKOR();
    EXPECT_EQ(listener->getBufferCount(), 1);
    EXPECT_EQ(listener->getErrorCount(), 0);
}

TEST_F(PulseRecorderWithServer, RecorderMayBeDroppedInsideACallback) {
    boost::weak_ptr<Recorder> weak;
    listener->onData = [this](Recorder*) { recorder.reset(); };
    make();
    weak = recorder;
    recorder->setBufferLength(1);
    ASSERT_TRUE(init());
    start();
    ASSERT_TRUE(listener->waitForBuffers(1));
    kdDrainEventsKOR();
    EXPECT_TRUE(weak.expired());
    EXPECT_EQ(listener->getErrorCount(), 0);
}

TEST_F(PulseRecorderWithServer, RecordsAgainAfterAStop) {
    make();
    ASSERT_TRUE(init());
    for (int i = 1; i <= 3; ++i) {
        start();
        ASSERT_TRUE(listener->waitForBuffers(listener->getBufferCount() + 1));
        stop();
        const int buffers = listener->getBufferCount();
        kdDrainEventsKOR();
        EXPECT_EQ(listener->getBufferCount(), buffers);
    }
    EXPECT_EQ(listener->getErrorCount(), 0);
}

// libpulse loses descriptors when a client disconnects in the middle of the server's handshake.
TEST_F(PulseRecorderWithServer, LosesNoDescriptorWhereverItsConnectionEnds) {
    const auto isQuiet = [] { return TestSupport::countThreads("talvox-audio") == 0; };
    std::size_t before = 0;
    for (int turns = 0; turns <= TURNS_OF_A_HANDSHAKE; ++turns) {
        listener = boost::make_shared<Collector>();
        make();
        ASSERT_TRUE(init());
        turnsUntilFailure = turns;
        start();
        if (turns == 0) {
            ASSERT_TRUE(listener->waitForBuffers(1));  // the client library has all that it keeps
            stop();
        } else {
            ASSERT_TRUE(listener->waitForError()) << turns;
        }
        ASSERT_TRUE(TestSupport::waitForThreads(isQuiet));
        const std::size_t now = TestSupport::countEntries("/proc/self/fd");
        before = turns == 0 ? now : before;
        EXPECT_EQ(before, now) << turns;
    }
}

TEST_F(PulseRecorderWithServer, SeveralRecordersRecordAtOnce) {
    make();
    ASSERT_TRUE(init());
    start();
    const auto otherListener = boost::make_shared<Collector>();
    boost::shared_ptr<Recorder> other;
    {
        const EventLock lock;
        other = Recorder::createRecorder();
        other->addListener(otherListener);
        ASSERT_TRUE(other->init());
        other->startRecording();
    }
    EXPECT_TRUE(listener->waitForBuffers(2));
    EXPECT_TRUE(otherListener->waitForBuffers(2));
    const EventLock lock;
    other.reset();
}

TEST_F(PulseRecorderWithServer, MicrophoneThatDeliversOnlyZerosIsLoggedOnce) {
    make();
    recorder->setBufferLength(50);
    ASSERT_TRUE(init());
    start();
    const std::string line =
        "PulseRecorder: the microphone delivers only zeros; is the microphone muted?";
    ASSERT_TRUE(listener->waitForBuffers(25));
    EXPECT_EQ(log.count(line), 1U);
    EXPECT_EQ(listener->getErrorCount(), 0);
}

}  // namespace
