#include "talvox/Recognizer.h"

#include <gmock/gmock.h>

#include <boost/make_shared.hpp>
#include <string>
#include <utility>

#include "RecordingListener.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "talvox/DummyRecognizer.h"
#include "talvox/Talvox.h"

using Talvox::DummyRecognizer;
using Talvox::Recognition;
using Talvox::RecognitionResult;
using Talvox::RecognitionResults;
using Talvox::Recognizer;
using Talvox::Settings;
using Talvox::SpeechError;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;
using TestSupport::RecordingListener;

namespace {

/** Delivers on command. */
class PlainRecognizer : public Recognizer {
  public:
    explicit PlainRecognizer(bool* destroyedFlag = nullptr)
        : Recognizer(&Talvox::Talvox::getInstance(), boost::make_shared<Settings>()),
          destroyed(destroyedFlag) {}
    ~PlainRecognizer() override {
        if (destroyed != nullptr) {
            *destroyed = true;
        }
    }
    void start() override {}
    void stop() override {}
    void cancel() override {}

    using Recognizer::callOnError;
    using Recognizer::callOnResults;
    std::size_t listenerCount() const { return listeners.size(); }

  private:
    bool* destroyed;
};

boost::shared_ptr<const RecognitionResults> oneResult(float confidence) {
    return boost::make_shared<const RecognitionResults>(
        RecognitionResults{RecognitionResult("text", confidence)});
}

/** Puts the engine's settings back. */
class EngineSettings {
  public:
    EngineSettings() : old(Talvox::Talvox::getInstance().getTalvoxSettings()->clone()) {}
    ~EngineSettings() { Talvox::Talvox::getInstance().setTalvoxSettings(old); }
    EngineSettings(const EngineSettings&) = delete;
    EngineSettings& operator=(const EngineSettings&) = delete;

  private:
    boost::shared_ptr<Settings> old;
};

}  // namespace

TEST(Recognizer, KeepsItsSettingsAndItsEngine) {
    const auto settings = boost::make_shared<const Settings>();
    const auto recognizer =
        boost::make_shared<DummyRecognizer>(&Talvox::Talvox::getInstance(), settings);
    EXPECT_EQ(settings, recognizer->getSettings());
    EXPECT_EQ(&Talvox::Talvox::getInstance(), recognizer->getEngine());
}

TEST(Recognizer, WithoutAnEngineIsABrokenInvariant) {
    const AssertCapture asserts;
    const auto recognizer =
        boost::make_shared<DummyRecognizer>(nullptr, boost::make_shared<const Settings>());
    ASSERT_EQ(1U, asserts.count());
    EXPECT_EQ("engine", asserts.reports()[0].condition);
    EXPECT_EQ(&Talvox::Talvox::getInstance(), recognizer->getEngine());
    const auto listener = boost::make_shared<RecordingListener>();
    recognizer->addListener(listener);
    recognizer->start();
    EXPECT_THAT(listener->errors, ElementsAre(7));
}

TEST(Recognizer, WithoutSettingsIsABrokenInvariantAndHasTheDefaults) {
    const AssertCapture asserts;
    const DummyRecognizer recognizer(&Talvox::Talvox::getInstance(), nullptr);
    ASSERT_EQ(1U, asserts.count());
    EXPECT_EQ("validatedSettings", asserts.reports()[0].condition);
    ASSERT_TRUE(recognizer.getSettings());
    EXPECT_EQ("ru-RU", recognizer.getSettings()->getLanguage());
}

TEST(Recognizer, AnErrorIsLoggedAndReachesEveryListener) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    const auto first = boost::make_shared<RecordingListener>();
    const auto second = boost::make_shared<RecordingListener>();
    recognizer->addListener(first);
    recognizer->addListener(second);
    const LogCapture log;
    recognizer->callOnError(SpeechError::ErrorNetwork);
    EXPECT_THAT(first->errors, ElementsAre(3));
    EXPECT_THAT(first->callers, ElementsAre(recognizer.get()));
    EXPECT_THAT(second->errors, ElementsAre(3));
    EXPECT_THAT(log.messages(), ElementsAre("Recognizer error: 3, ErrorNetwork"));
}

TEST(Recognizer, ListenersAreCalledInTheOrderOfAddition) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    std::string order;
    std::vector<boost::shared_ptr<RecordingListener>> listeners;
    for (const char letter : {'a', 'b', 'c'}) {
        listeners.push_back(boost::make_shared<RecordingListener>());
        listeners.back()->whenError = [&order, letter] { order += letter; };
        recognizer->addListener(listeners.back());
    }
    recognizer->callOnError(SpeechError::ErrorServer);
    EXPECT_EQ("abc", order);
}

TEST(Recognizer, AReleasedListenerIsRemovedAndTheErrorStillLogged) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    auto released = boost::make_shared<RecordingListener>();
    const auto live = boost::make_shared<RecordingListener>();
    recognizer->addListener(released);
    recognizer->addListener(live);
    released.reset();
    EXPECT_EQ(2U, recognizer->listenerCount());
    const LogCapture log;
    recognizer->callOnError(SpeechError::ErrorAudio);
    EXPECT_EQ(1U, recognizer->listenerCount());
    EXPECT_THAT(live->errors, ElementsAre(1));
    EXPECT_THAT(log.messages(), ElementsAre("Recognizer error: 1, ErrorAudio"));
}

TEST(Recognizer, AnErrorIsLoggedAlsoWhenNoListenerIsLeft) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    recognizer->addListener(boost::make_shared<RecordingListener>());
    const LogCapture log;
    recognizer->callOnError(SpeechError::ErrorAudio, "because");
    recognizer->callOnError(SpeechError::ErrorBusy);
    EXPECT_EQ(0U, recognizer->listenerCount());
    EXPECT_THAT(log.messages(),
                ElementsAre("Recognizer error: 1, ErrorAudio", "Recognizer error reason: because",
                            "Recognizer error: 8, ErrorBusy"));
}

TEST(Recognizer, ResultsRemoveReleasedListenersToo) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    recognizer->addListener(boost::make_shared<RecordingListener>());
    const LogCapture log;
    recognizer->callOnResults(oneResult(0.5F), "request");
    EXPECT_EQ(0U, recognizer->listenerCount());
    EXPECT_THAT(log.messages(), IsEmpty());
}

TEST(Recognizer, AListenerMayDropTheLastReferenceWhileOthersWait) {
    bool destroyed = false;
    auto recognizer = boost::make_shared<PlainRecognizer>(&destroyed);
    Recognizer* const address = recognizer.get();
    const auto dropping = boost::make_shared<RecordingListener>();
    const auto next = boost::make_shared<RecordingListener>();
    dropping->whenError = [&recognizer] { recognizer.reset(); };
    next->whenError = [&destroyed] { EXPECT_FALSE(destroyed); };
    recognizer->addListener(dropping);
    recognizer->addListener(next);
    recognizer->callOnError(SpeechError::ErrorServer);
    EXPECT_THAT(next->errors, ElementsAre(4));
    EXPECT_THAT(next->callers, ElementsAre(address));
    EXPECT_TRUE(destroyed);
}

TEST(Recognizer, AListenerMayDropTheLastReferenceInResultsWhileOthersWait) {
    bool destroyed = false;
    auto recognizer = boost::make_shared<PlainRecognizer>(&destroyed);
    Recognizer* const address = recognizer.get();
    const auto dropping = boost::make_shared<RecordingListener>();
    const auto next = boost::make_shared<RecordingListener>();
    dropping->whenResults = [&recognizer] { recognizer.reset(); };
    next->whenResults = [&destroyed] { EXPECT_FALSE(destroyed); };
    recognizer->addListener(dropping);
    recognizer->addListener(next);
    recognizer->callOnResults(oneResult(0.5F), "request");
    EXPECT_EQ(1U, next->recognitions.size());
    EXPECT_THAT(next->callers, ElementsAre(address));
    EXPECT_TRUE(destroyed);
}

TEST(Recognizer, AListenerThatDiesBeforeItsTurnIsSkipped) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    const auto killer = boost::make_shared<RecordingListener>();
    auto victim = boost::make_shared<RecordingListener>();
    bool victimCalled = false;
    const auto last = boost::make_shared<RecordingListener>();
    killer->whenError = [&victim] { victim.reset(); };
    victim->whenError = [&victimCalled] { victimCalled = true; };
    recognizer->addListener(killer);
    recognizer->addListener(victim);
    recognizer->addListener(last);
    recognizer->callOnError(SpeechError::ErrorServer);
    EXPECT_FALSE(victimCalled);
    EXPECT_THAT(last->errors, ElementsAre(4));
}

TEST(Recognizer, AListenerAddedDuringADeliveryHearsTheNextOne) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    const auto adding = boost::make_shared<RecordingListener>();
    const auto added = boost::make_shared<RecordingListener>();
    adding->whenError = [&] { recognizer->addListener(added); };
    recognizer->addListener(adding);
    recognizer->callOnError(SpeechError::ErrorServer);
    EXPECT_THAT(added->errors, IsEmpty());
    recognizer->callOnError(SpeechError::ErrorBusy);
    EXPECT_THAT(added->errors, ElementsAre(8));
}

TEST(Recognizer, EachListenerGetsARecognitionOfItsOwnWithTheSameResults) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    const auto first = boost::make_shared<RecordingListener>();
    const auto second = boost::make_shared<RecordingListener>();
    recognizer->addListener(first);
    recognizer->addListener(second);
    const auto results = oneResult(0.95F);
    recognizer->callOnResults(results, "request");
    ASSERT_EQ(1U, first->recognitions.size());
    ASSERT_EQ(1U, second->recognitions.size());
    EXPECT_NE(first->recognitions[0], second->recognitions[0]);
    for (const auto& listener : {first, second}) {
        EXPECT_EQ(results, listener->recognitions[0]->getResults());
        EXPECT_EQ(Recognition::OutcomeAccepted, listener->recognitions[0]->getOutcome());
        EXPECT_EQ("request", listener->recognitions[0]->getRequestId());
        EXPECT_THAT(listener->callers, ElementsAre(recognizer.get()));
    }
}

TEST(Recognizer, TheOutcomeFollowsTheEnginesThresholdsNotItsOwn) {
    const EngineSettings restore;
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    const auto listener = boost::make_shared<RecordingListener>();
    recognizer->addListener(listener);
    const auto engineSettings = boost::make_shared<Settings>();
    engineSettings->putFloat(Settings::SKS_LOWER_CONFIDENCE, 0.7F);
    Talvox::Talvox::getInstance().setTalvoxSettings(engineSettings);
    recognizer->callOnResults(oneResult(0.6F), "");
    EXPECT_EQ(Recognition::OutcomeRejected, listener->recognitions.at(0)->getOutcome());
}

TEST(Recognizer, MissingResultsAreABrokenInvariantAndCountAsNone) {
    const auto recognizer = boost::make_shared<PlainRecognizer>();
    const auto listener = boost::make_shared<RecordingListener>();
    recognizer->addListener(listener);
    const AssertCapture asserts;
    recognizer->callOnResults(nullptr, "");
    EXPECT_EQ(1U, asserts.count());
    ASSERT_EQ(1U, listener->recognitions.size());
    EXPECT_TRUE(listener->recognitions[0]->getResults()->empty());
    EXPECT_EQ(Recognition::OutcomeUncertain, listener->recognitions[0]->getOutcome());
}

TEST(DummyRecognizer, AnswersEveryCallAtOnce) {
    const auto recognizer = boost::make_shared<DummyRecognizer>(
        &Talvox::Talvox::getInstance(), boost::make_shared<const Settings>());
    const auto first = boost::make_shared<RecordingListener>();
    const auto second = boost::make_shared<RecordingListener>();
    recognizer->addListener(first);
    recognizer->addListener(second);
    recognizer->start();
    EXPECT_THAT(first->errors, ElementsAre(7));
    EXPECT_THAT(second->errors, ElementsAre(7));
    recognizer->stop();
    EXPECT_THAT(first->errors, ElementsAre(7, 7));
    recognizer->cancel();
    EXPECT_THAT(first->errors, ElementsAre(7, 7, 5));
    EXPECT_THAT(second->errors, ElementsAre(7, 7, 5));
}
