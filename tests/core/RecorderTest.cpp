#include "core/sound/Recorder.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "core/sound/FileRecorder.h"
#include "core/util/EventLock.h"

namespace {

using Sound::Recorder;
using Sound::RecorderListener;
using Sound::SoundDataBuffer;
using Sound::SoundDataInfo;

/** A recorder whose events the test makes. */
class HandRecorder : public Recorder {
  public:
    explicit HandRecorder(bool* destroyedFlag = nullptr) : destroyed(destroyedFlag) {}
    ~HandRecorder() override {
        if (destroyed != nullptr) {
            *destroyed = true;
        }
    }
    bool init() override { return true; }
    using Recorder::notifyData;
    using Recorder::notifyError;

  private:
    bool* destroyed;
};

/** Writes down what it hears, then does what the test asks for. */
class NotingListener : public RecorderListener {
  public:
    NotingListener(std::vector<std::string>& log, const std::string& ownName)
        : notes(log), name(ownName) {}

    void onRecorderDataReceived(Recorder* recorder,
                                boost::shared_ptr<const SoundDataBuffer> buffer) override {
        notes.push_back(name + " data " + std::to_string(buffer->getSampleCount()));
        if (reaction) {
            reaction(recorder);
        }
    }

    void onRecorderError(Recorder* recorder) override {
        notes.push_back(name + " error");
        if (reaction) {
            reaction(recorder);
        }
    }

    std::function<void(Recorder*)> reaction;

  private:
    std::vector<std::string>& notes;
    const std::string name;
};

boost::shared_ptr<const SoundDataBuffer> makeSilence(int samples) {
    return boost::make_shared<SoundDataBuffer>(
        SoundDataInfo(SoundDataInfo::NONE, 1, 16000, 2, samples));
}

class RecorderTest : public ::testing::Test {
  protected:
    RecorderTest() {
        recorder->addListener(first);
        recorder->addListener(second);
        recorder->startRecording();
    }

    using Notes = std::vector<std::string>;

    const Util::EventLock lock;
    Notes notes;
    boost::shared_ptr<HandRecorder> recorder = boost::make_shared<HandRecorder>();
    boost::shared_ptr<NotingListener> first =
        boost::make_shared<NotingListener>(std::ref(notes), "first");
    boost::shared_ptr<NotingListener> second =
        boost::make_shared<NotingListener>(std::ref(notes), "second");
};

TEST_F(RecorderTest, HasTheDocumentedDefaults) {
    const HandRecorder fresh;
    EXPECT_EQ(fresh.getSampleRate(), 16000);
    EXPECT_EQ(fresh.getBufferLength(), 100);
    EXPECT_EQ(fresh.getMode(), Recorder::MODE_VOICE_RECOGNITION);
    EXPECT_FALSE(fresh.isRecording());
}

TEST_F(RecorderTest, ListenersHearInTheOrderOfAddition) {
    recorder->notifyData(makeSilence(160));
    recorder->notifyError();
    EXPECT_EQ(notes, (Notes{"first data 160", "second data 160", "first error", "second error"}));
}

TEST_F(RecorderTest, ListenersAreHeldWeakly) {
    first.reset();
    recorder->notifyData(makeSilence(1));
    EXPECT_EQ(notes, (Notes{"second data 1"}));
}

TEST_F(RecorderTest, NobodyHearsABufferAfterTheStopInsideOne) {
    first->reaction = [](Recorder* stopped) { stopped->stopRecording(); };
    recorder->notifyData(makeSilence(1));
    EXPECT_FALSE(recorder->isRecording());
    EXPECT_EQ(notes, (Notes{"first data 1"}));
}

TEST_F(RecorderTest, ErrorReachesEveryListenerThoughOneStopsTheRecorder) {
    first->reaction = [](Recorder* stopped) { stopped->stopRecording(); };
    recorder->notifyError();
    EXPECT_EQ(notes, (Notes{"first error", "second error"}));
}

TEST_F(RecorderTest, ListenerMayDropTheRecorder) {
    bool destroyed = false;
    recorder = boost::make_shared<HandRecorder>(&destroyed);
    recorder->addListener(first);
    recorder->addListener(second);
    bool destroyedInside = false;
    first->reaction = [this, &destroyed, &destroyedInside](Recorder*) {
        recorder.reset();
        destroyedInside = destroyed;
    };
    HandRecorder* const raw = recorder.get();
    raw->notifyError();
    EXPECT_FALSE(destroyedInside);
    EXPECT_TRUE(destroyed);
    EXPECT_EQ(notes, (Notes{"first error", "second error"}));
}

TEST_F(RecorderTest, NotSharedRecorderCanNotifyAsWell) {
    HandRecorder local;
    local.addListener(first);
    local.notifyError();
    EXPECT_EQ(notes, (Notes{"first error"}));
}

class RecorderFactoryTest : public ::testing::Test {
  protected:
    ~RecorderFactoryTest() override { Recorder::setFactory(Recorder::Factory()); }
};

TEST_F(RecorderFactoryTest, InstalledFactoryMakesTheRecorders) {
    auto made = boost::make_shared<HandRecorder>();
    Recorder::setFactory([made] { return made; });
    EXPECT_EQ(Recorder::createRecorder(), made);
}

TEST_F(RecorderFactoryTest, FactoryWithoutARecorderGivesOneThatCannotRecord) {
    Recorder::setFactory([] { return boost::shared_ptr<Recorder>(); });
    const boost::shared_ptr<Recorder> recorder = Recorder::createRecorder();
    ASSERT_TRUE(recorder);
    EXPECT_FALSE(recorder->init());
}

TEST_F(RecorderFactoryTest, FactoryMayReplaceItself) {
    Recorder::setFactory([] {
        Recorder::setFactory([] { return boost::make_shared<HandRecorder>(); });
        return boost::make_shared<Sound::FileRecorder>(std::vector<int16_t>());
    });
    EXPECT_TRUE(boost::dynamic_pointer_cast<Sound::FileRecorder>(Recorder::createRecorder()));
    EXPECT_TRUE(boost::dynamic_pointer_cast<HandRecorder>(Recorder::createRecorder()));
}

TEST_F(RecorderFactoryTest, EmptyFactoryRestoresThePlatformsOwn) {
    Recorder::setFactory([] { return boost::make_shared<HandRecorder>(); });
    Recorder::setFactory(Recorder::Factory());
    const boost::shared_ptr<Recorder> recorder = Recorder::createRecorder();
    ASSERT_TRUE(recorder);
    EXPECT_FALSE(boost::dynamic_pointer_cast<HandRecorder>(recorder));
}

}  // namespace
