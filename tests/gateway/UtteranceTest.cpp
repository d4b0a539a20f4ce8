#include "gateway/Utterance.h"

#include <gtest/gtest.h>

#include "gateway/RecordedSpeech.h"
#include "gateway/SharedPool.h"

namespace {

using Gateway::Hypothesis;
using Gateway::Utterance;
using GatewayTest::sharedPool;
using Samples = std::vector<int16_t>;

std::vector<Hypothesis> recognise(Gateway::DecoderPool& pool, const Samples& samples,
                                  std::size_t piece,
                                  Utterance::Arrival arrival = Utterance::Arrival::STREAMED) {
    Utterance utterance(pool, arrival);
    for (std::size_t i = 0; i < samples.size(); i += piece) {
        EXPECT_TRUE(
            utterance.add(Samples(&samples[i], &samples[i] + std::min(piece, samples.size() - i))));
    }
    std::vector<Hypothesis> hypotheses;
    EXPECT_EQ(Utterance::Status::DONE, utterance.finish(hypotheses));
    return hypotheses;
}

std::vector<Hypothesis> recognise(const std::string& recording, std::size_t piece = 1600) {
    return recognise(sharedPool(), GatewayTest::readRecording(recording), piece);
}

/** More speech than the mean of a streamed utterance is measured over. */
Samples longSpeech() {
    Samples samples = GatewayTest::readRecording("something.raw");
    const Samples more = GatewayTest::readRecording("goforward.raw");
    samples.insert(samples.end(), more.begin(), more.end());
    return samples;
}

/** The noise ends the same, whatever its length. */
Samples afterFaintNoise(const Samples& sound, std::size_t count) {
    Samples samples;
    for (std::size_t left = count; left > 0; --left) {
        samples.push_back(static_cast<int16_t>(left * 7919 % 31) - 15);
    }
    samples.insert(samples.end(), sound.begin(), sound.end());
    return samples;
}

void expectSame(const std::vector<Hypothesis>& expected, const std::vector<Hypothesis>& actual) {
    ASSERT_EQ(expected.size(), actual.size());
    for (std::size_t i = 0; i < expected.size(); ++i) {
        EXPECT_EQ(expected[i].text, actual[i].text);
        // Exactly: the same sound must give the same bits.
        EXPECT_EQ(expected[i].confidence, actual[i].confidence);
    }
}

}  // namespace

TEST(Utterance, UnderstandsRecordedSpeech) {
    const std::vector<Hypothesis> forward = recognise("goforward.raw");
    ASSERT_FALSE(forward.empty());
    EXPECT_EQ("go forward ten meters", forward[0].text);
    EXPECT_GT(forward[0].confidence, 0.5);
    const std::vector<Hypothesis> something = recognise("something.raw");
    ASSERT_FALSE(something.empty());
    EXPECT_EQ("go somewhere and do something", something[0].text);
    EXPECT_GT(something[0].confidence, 0.8);
}

TEST(Utterance, OffersDistinctTextsBestFirst) {
    const std::vector<Hypothesis> hypotheses = recognise("goforward.raw");
    ASSERT_EQ(Gateway::SpeechDecoder::MAX_HYPOTHESES, hypotheses.size());
    for (std::size_t i = 1; i < hypotheses.size(); ++i) {
        EXPECT_LE(hypotheses[i].confidence, hypotheses[i - 1].confidence);
        EXPECT_GE(hypotheses[i].confidence, 0.0);
        EXPECT_FALSE(hypotheses[i].text.empty());
        for (std::size_t k = 0; k < i; ++k) {
            EXPECT_NE(hypotheses[k].text, hypotheses[i].text);
        }
    }
}

TEST(Utterance, IsNotInfluencedByTheOneBefore) {
    Gateway::DecoderPool pool(Gateway::SpeechModel(), 1);
    const Samples a = GatewayTest::readRecording("goforward.raw");
    const Samples b = GatewayTest::readRecording("something.raw");
    const std::vector<Hypothesis> freshA = recognise(pool, a, 1600);
    const std::vector<Hypothesis> afterA = recognise(pool, b, 1600);
    expectSame(freshA, recognise(pool, a, 1600));
    expectSame(afterA, recognise(pool, b, 1600));
    expectSame(freshA, recognise(pool, a, 1600));
    Gateway::DecoderPool otherPool(Gateway::SpeechModel(), 1);
    expectSame(afterA, recognise(otherPool, b, 1600));
}

TEST(Utterance, IsNotInfluencedByOneThatWasAbandoned) {
    Gateway::DecoderPool pool(Gateway::SpeechModel(), 1);
    const Samples a = GatewayTest::readRecording("goforward.raw");
    const std::vector<Hypothesis> fresh = recognise(pool, a, 1600);
    Samples loud = longSpeech();
    for (int16_t& sample : loud) {
        sample = static_cast<int16_t>(sample * 2 / 3);
    }
    {
        Utterance abandoned(pool, Utterance::Arrival::STREAMED);
        EXPECT_TRUE(abandoned.add(loud));
        EXPECT_GT(abandoned.getDecodeMs(), 0U);
    }
    expectSame(fresh, recognise(pool, a, 1600));
}

TEST(Utterance, GivesTheSameAnswerWhateverThePieces) {
    const Samples samples = longSpeech();
    for (const Utterance::Arrival arrival :
         {Utterance::Arrival::STREAMED, Utterance::Arrival::WHOLE}) {
        const std::vector<Hypothesis> expected = recognise(sharedPool(), samples, 1600, arrival);
        for (const std::size_t piece : {97U, 5000U, 1000000U}) {
            expectSame(expected, recognise(sharedPool(), samples, piece, arrival));
        }
    }
}

TEST(Utterance, UnderstandsTheSameHoweverLongTheWaitBeforeTheSpeech) {
    const Samples shortWait = afterFaintNoise(longSpeech(), 16000);
    const Samples longWait = afterFaintNoise(longSpeech(), 48000);
    for (const Utterance::Arrival arrival :
         {Utterance::Arrival::STREAMED, Utterance::Arrival::WHOLE}) {
        const std::vector<Hypothesis> expected = recognise(sharedPool(), shortWait, 1600, arrival);
        const std::vector<Hypothesis> actual = recognise(sharedPool(), longWait, 1600, arrival);
        ASSERT_EQ(expected.size(), actual.size());
        for (std::size_t i = 0; i < expected.size(); ++i) {
            EXPECT_EQ(expected[i].text, actual[i].text);
            // The front end that measures the mean adapts to the noise, to longer noise more.
            EXPECT_NEAR(expected[i].confidence, actual[i].confidence, 0.001);
        }
    }
}

TEST(Utterance, DecodesAStreamedOneWhileItArrives) {
    const Samples samples = longSpeech();
    Utterance utterance(sharedPool(), Utterance::Arrival::STREAMED);
    EXPECT_TRUE(utterance.add(Samples(samples.begin(), samples.begin() + 16000)));
    EXPECT_EQ(0U, utterance.getDecodeMs());
    EXPECT_TRUE(utterance.add(Samples(samples.begin() + 16000, samples.end())));
    EXPECT_GT(utterance.getDecodeMs(), 0U);
    std::vector<Hypothesis> hypotheses;
    EXPECT_EQ(Utterance::Status::DONE, utterance.finish(hypotheses));
    EXPECT_EQ(samples.size() / 16, utterance.getDurationMs());
}

TEST(Utterance, DecodesAStreamedOneWithLittleSpeechAsAWhole) {
    const Samples samples = GatewayTest::readRecording("cards/002.wav");
    Utterance utterance(sharedPool(), Utterance::Arrival::STREAMED);
    EXPECT_TRUE(utterance.add(samples));
    EXPECT_EQ(0U, utterance.getDecodeMs());
    std::vector<Hypothesis> hypotheses;
    EXPECT_EQ(Utterance::Status::DONE, utterance.finish(hypotheses));
    ASSERT_FALSE(hypotheses.empty());
    expectSame(recognise(sharedPool(), samples, 1600, Utterance::Arrival::WHOLE), hypotheses);
}

TEST(Utterance, DecodesAWholeOneWhenItIsComplete) {
    Utterance utterance(sharedPool(), Utterance::Arrival::WHOLE);
    EXPECT_TRUE(utterance.add(longSpeech()));
    EXPECT_EQ(0U, utterance.getDecodeMs());
    std::vector<Hypothesis> hypotheses;
    EXPECT_EQ(Utterance::Status::DONE, utterance.finish(hypotheses));
    EXPECT_GT(utterance.getDecodeMs(), 0U);
    ASSERT_FALSE(hypotheses.empty());
    EXPECT_EQ(0U, hypotheses[0].text.find("go somewhere and do something"));
}

TEST(Utterance, UnderstandsNothingInSilence) {
    EXPECT_TRUE(recognise(sharedPool(), Samples(), 1).empty());
    EXPECT_TRUE(recognise(sharedPool(), Samples(100, 0), 100).empty());
    EXPECT_TRUE(recognise(sharedPool(), Samples(48000, 0), 1600).empty());
}

TEST(Utterance, UnderstandsShortWords) {
    // Less speech than the cepstral mean is measured over.
    const Samples samples = GatewayTest::readRecording("cards/001.wav");
    const std::vector<Hypothesis> hypotheses = recognise(sharedPool(), samples, 1600);
    ASSERT_FALSE(hypotheses.empty());
    EXPECT_EQ("ten of clubs", hypotheses[0].text);
}

TEST(Utterance, EndsWhereTheDecoderWould) {
    Utterance utterance(sharedPool(), Utterance::Arrival::STREAMED);
    const Samples second(16000, 0);
    for (std::size_t i = 0; i < Utterance::MAX_SECONDS; ++i) {
        ASSERT_TRUE(utterance.add(second));
    }
    EXPECT_FALSE(utterance.add(Samples(1, 0)));
    EXPECT_EQ(120000U, utterance.getDurationMs());
}

TEST(Utterance, CatchesUpOnceADecoderIsFree) {
    Gateway::DecoderPool pool(Gateway::SpeechModel(), 1);
    const Samples samples = GatewayTest::readRecording("goforward.raw");
    const std::vector<Hypothesis> expected = recognise(pool, samples, 1600);
    Gateway::DecoderPool::Lease other = pool.tryAcquire();
    ASSERT_TRUE(other);
    Utterance utterance(pool, Utterance::Arrival::STREAMED);
    EXPECT_TRUE(utterance.add(samples));
    EXPECT_EQ(0U, utterance.getDecodeMs());
    other.reset();
    std::vector<Hypothesis> hypotheses;
    EXPECT_EQ(Utterance::Status::DONE, utterance.finish(hypotheses));
    expectSame(expected, hypotheses);
}

TEST(Utterance, GetsNoDecoderFromAClosedPool) {
    Gateway::DecoderPool pool(Gateway::SpeechModel(), 1);
    pool.close();
    Utterance utterance(pool, Utterance::Arrival::STREAMED);
    EXPECT_TRUE(utterance.add(GatewayTest::readRecording("goforward.raw")));
    std::vector<Hypothesis> hypotheses;
    EXPECT_EQ(Utterance::Status::BUSY, utterance.finish(hypotheses));
    EXPECT_TRUE(hypotheses.empty());
}
