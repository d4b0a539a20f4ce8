#include "core/sensor/ProximityGestureRecognizer.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <utility>

#include "core/sensor/ManualProximitySource.h"
#include "pal/kd_time.h"
#include "support/LogCapture.h"

namespace {

using Sensor::ManualProximitySource;
using Sensor::ProximityGestureRecognizer;
using Sensor::ProximitySource;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class ProximityGestures : public testing::Test {
  protected:
    ProximityGestures() {
        kdUseManualClockKOR(0);
        recognizer->setCallback([this](const std::string& name) { heard.push_back(name); });
    }
    ~ProximityGestures() override {
        recognizer->stop();
        kdUseRealClockKOR();
    }

    static void pass(int milliseconds) { kdAdvanceClockKOR(milliseconds * INT64_C(1000000)); }

    void add(const std::string& name, const std::string& pattern) {
        ASSERT_EQ(recognizer->addGesture(name, pattern), "");
    }

    /** A hand that is there for so long, then away for so long. */
    void wave(int nearMs, int farMs) {
        source->feed(true);
        pass(nearMs);
        source->feed(false);
        pass(farMs);
    }

    boost::shared_ptr<ManualProximitySource> source = boost::make_shared<ManualProximitySource>();
    boost::shared_ptr<ProximityGestureRecognizer> recognizer =
        boost::make_shared<ProximityGestureRecognizer>(source);
    std::vector<std::string> heard;
};

TEST_F(ProximityGestures, AreReportedWhenTheLastSpanEnds) {
    add("wave", "near:50-500");
    ASSERT_TRUE(recognizer->start());
    source->feed(true);
    pass(50);
    EXPECT_THAT(heard, IsEmpty());
    source->feed(false);
    EXPECT_THAT(heard, ElementsAre("wave"));
}

TEST_F(ProximityGestures, OutsideTheirBoundsAreNone) {
    add("wave", "near:50-500");
    recognizer->start();
    wave(49, 100);
    wave(501, 100);
    EXPECT_THAT(heard, IsEmpty());
    wave(500, 100);
    EXPECT_THAT(heard, ElementsAre("wave"));
}

TEST_F(ProximityGestures, OfSeveralSpansNeedAllOfThem) {
    add("double", "near:50-500 far:50-500 near:50-500");
    recognizer->start();
    wave(100, 700);
    wave(100, 100);
    EXPECT_THAT(heard, IsEmpty());
    wave(100, 100);
    EXPECT_THAT(heard, ElementsAre("double"));
}

TEST_F(ProximityGestures, HeldAreReportedAtTheirMinimumOnce) {
    add("hold", "near:1000-");
    add("long hold", "near:3000-");
    recognizer->start();
    source->feed(true);
    pass(999);
    EXPECT_THAT(heard, IsEmpty());
    pass(1);
    EXPECT_THAT(heard, ElementsAre("hold"));
    pass(2000);
    EXPECT_THAT(heard, ElementsAre("hold", "long hold"));
    source->feed(false);
    pass(5000);
    EXPECT_THAT(heard, ElementsAre("hold", "long hold"));
}

TEST_F(ProximityGestures, CanTellOneWaveFromTwo) {
    add("once", "near:50-500 far:600-");
    add("twice", "near:50-500 far:50-500 near:50-500");
    recognizer->start();
    source->feed(false);
    wave(100, 600);
    EXPECT_THAT(heard, ElementsAre("once"));
    wave(100, 100);
    wave(100, 500);
    EXPECT_THAT(heard, ElementsAre("once", "twice"));
}

TEST_F(ProximityGestures, RepeatedSamplesOfOneStateAreOneSpan) {
    add("hold", "near:1000-");
    recognizer->start();
    for (int sample = 0; sample < 10; ++sample) {
        source->feed(true);
        pass(100);
    }
    EXPECT_THAT(heard, ElementsAre("hold"));
}

TEST_F(ProximityGestures, AreReportedInTheOrderOfAddition) {
    add("second letter", "near:1-1000");
    add("first letter", "near:0-2000");
    recognizer->start();
    wave(10, 10);
    EXPECT_THAT(heard, ElementsAre("second letter", "first letter"));
}

TEST_F(ProximityGestures, OfOneNameReplaceEachOther) {
    add("wave", "near:50-100");
    add("wave", "near:500-600");
    recognizer->start();
    wave(75, 10);
    EXPECT_THAT(heard, IsEmpty());
    wave(550, 10);
    EXPECT_THAT(heard, ElementsAre("wave"));
}

TEST_F(ProximityGestures, AreNotReportedAfterStop) {
    add("hold", "near:1000-");
    recognizer->start();
    source->feed(true);
    pass(500);
    recognizer->stop();
    EXPECT_FALSE(source->isStarted());
    pass(1000);
    EXPECT_THAT(heard, IsEmpty());
}

TEST_F(ProximityGestures, BeginAnewWithEachStart) {
    add("twice", "near:50-500 far:50-500 near:50-500");
    recognizer->start();
    wave(100, 100);
    recognizer->stop();
    recognizer->start();
    wave(100, 100);
    EXPECT_THAT(heard, IsEmpty());
}

TEST_F(ProximityGestures, MayStopTheRecognizerFromTheCallback) {
    add("one", "near:1-1000");
    add("two", "near:1-1000");
    recognizer->setCallback([this](const std::string& name) {
        heard.push_back(name);
        recognizer->stop();
    });
    recognizer->start();
    wave(10, 10);
    EXPECT_THAT(heard, ElementsAre("one"));
}

TEST_F(ProximityGestures, MayStartTheRecognizerAnewFromTheCallback) {
    add("one", "near:1-1000");
    add("two", "near:1-1000");
    add("gone", "far:0-");
    recognizer->setCallback([this](const std::string& name) {
        heard.push_back(name);
        recognizer->stop();
        recognizer->start();
    });
    recognizer->start();
    wave(10, 10);
    // Nothing has been seen since the start: neither the second wave nor that the hand is gone.
    EXPECT_THAT(heard, ElementsAre("one"));
    wave(10, 10);
    EXPECT_THAT(heard, ElementsAre("one", "one"));
}

TEST_F(ProximityGestures, MayStopTheRecognizerWhileItStarts) {
    class EagerSource : public ManualProximitySource {
      public:
        bool start(Callback callback) override {
            ManualProximitySource::start(std::move(callback));
            feed(true);
            return true;
        }
    };
    const auto eager = boost::make_shared<EagerSource>();
    const auto stopped = boost::make_shared<ProximityGestureRecognizer>(eager);
    stopped->addGesture("there", "near:0-");
    stopped->setCallback([&stopped](const std::string& /*name*/) { stopped->stop(); });
    EXPECT_TRUE(stopped->start());
    EXPECT_FALSE(eager->isStarted());
    EXPECT_TRUE(stopped->start());
    EXPECT_FALSE(eager->isStarted());
}

TEST_F(ProximityGestures, MayDropTheRecognizerFromTheCallback) {
    boost::shared_ptr<ProximityGestureRecognizer> dropped =
        boost::make_shared<ProximityGestureRecognizer>(source);
    dropped->addGesture("hold", "near:10-");
    dropped->setCallback([&dropped](const std::string& /*name*/) { dropped.reset(); });
    dropped->start();
    source->feed(true);
    pass(10);
    EXPECT_EQ(dropped, nullptr);
    EXPECT_FALSE(source->isStarted());
}

TEST_F(ProximityGestures, WithABadDescriptionAreRefusedAndLogged) {
    const TestSupport::LogCapture log;
    EXPECT_THAT(recognizer->addGesture("wave", "near:5"), HasSubstr("has no \"-\""));
    EXPECT_EQ(recognizer->addGesture("", "near:5-10"), "a gesture needs a name");
    EXPECT_THAT(log.messages(), ElementsAre(HasSubstr("gesture wave is refused"),
                                            HasSubstr("a gesture needs a name")));
}

TEST_F(ProximityGestures, NeedASensor) {
    const TestSupport::LogCapture log;
    const auto blind =
        boost::make_shared<ProximityGestureRecognizer>(boost::shared_ptr<ProximitySource>());
    EXPECT_FALSE(blind->start());
    EXPECT_THAT(log.messages(), ElementsAre(HasSubstr("there is no proximity sensor")));
    blind->stop();
}

TEST_F(ProximityGestures, UseTheInstalledSensor) {
    ProximitySource::setFactory([this] { return source; });
    const auto installed = boost::make_shared<ProximityGestureRecognizer>();
    ProximitySource::setFactory(nullptr);
    EXPECT_TRUE(installed->start());
    EXPECT_TRUE(source->isStarted());
    installed->stop();
    EXPECT_EQ(ProximitySource::createSource(), nullptr);
}

}  // namespace
