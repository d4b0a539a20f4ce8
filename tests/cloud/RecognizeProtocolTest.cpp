#include "talvox/impl/RecognizeProtocol.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>
#include <condition_variable>
#include <mutex>

#include "EngineTest.h"
#include "GatewayAnswers.h"
#include "Sounds.h"
#include "core/network/NetworkManager.h"
#include "core/sound/OggSpeexEncoder.h"
#include "core/util/EventLock.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"
#include "support/OggSpeexDecoder.h"
#include "support/PrivateMember.h"
#include "support/ScriptedHttpServer.h"
#include "talvox/impl/ChunkedRecognizeProtocol.h"
#include "talvox/impl/SimpleRecognizeProtocol.h"

namespace TestSupport {

struct MakeHttpRequest {
    using Type = void (Talvox::SimpleRecognizeProtocol::*)(
        const boost::shared_ptr<const Sound::SoundDataBuffer>&);
    friend Type memberOf(MakeHttpRequest);
};
template struct PrivateMember<MakeHttpRequest, &Talvox::SimpleRecognizeProtocol::makeHttpRequest>;

}  // namespace TestSupport

namespace {

using CloudTest::makeBuffer;
using CloudTest::makeConstantBuffer;
using CloudTest::UUID;
using Talvox::RecognizeProtocol;
using Talvox::Settings;
using TestSupport::Answer;
using TestSupport::AssertCapture;
using TestSupport::LogCapture;
using TestSupport::ScriptedHttpServer;

const std::string BOUNDARY = "1BEF0A57BE110FD467A";

class Listener : public Talvox::RecognizeProtocolListener {
  public:
    void onProtocolError(Talvox::SpeechError error) override { add(error.getErrorString()); }
    void onProtocolVoiceBegin() override { add("voiceBegin"); }
    void onProtocolVoiceCaptured() override { add("voiceCaptured"); }
    void onProtocolResults(boost::shared_ptr<const Talvox::RecognitionResults> received,
                           const std::string& requestId) override {
        {
            const std::lock_guard<std::mutex> lock(mutex);
            results = received;
        }
        add("results " + requestId);
    }

    /** Waits until `count` events have come; gives all. */
    std::vector<std::string> waitForEvents(std::size_t count) {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait_for(lock, std::chrono::seconds(20),
                         [this, count] { return events.size() >= count; });
        return events;
    }

    std::vector<std::string> getEvents() { return waitForEvents(0); }

    /** Called at the end of each event, without a lock of this object. */
    std::function<void(const std::string&)> hook;
    boost::shared_ptr<const Talvox::RecognitionResults> results;

  private:
    void add(const std::string& event) {
        {
            const std::lock_guard<std::mutex> lock(mutex);
            events.push_back(event);
            changed.notify_all();
        }
        if (hook) {
            hook(event);
        }
    }

    std::mutex mutex;
    std::condition_variable changed;
    std::vector<std::string> events;
};

using Events = std::vector<std::string>;

class RecognizeProtocolTest : public CloudTest::EngineTest {
  protected:
    RecognizeProtocolTest() {
        configureText(Settings::SKS_URL, server.getUrl());
        configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_PCM);
    }

    ~RecognizeProtocolTest() override {
        const Util::EventLock lock;
        protocol.reset();
    }

    void make(const std::string& type) {
        protocol = RecognizeProtocol::create(recognizer.get(), type);
        protocol->addListener(listener);
    }

    void handle(const CloudTest::BufferPtr& buffer) {
        const Util::EventLock lock;
        protocol->handle(buffer);
    }

    void sendRequest() {
        const Util::EventLock lock;
        const boost::shared_ptr<RecognizeProtocol> sending = protocol;
        sending->sendRequest();
    }

    /** Moves the clock on until the head of request `count` is there. */
    bool advanceUntilHead(std::size_t count) {
        for (int i = 0; i < 100; ++i) {
            if (server.waitForHead(count, std::chrono::milliseconds(20))) {
                return true;
            }
            advanceMs(100);
        }
        return false;
    }

    ScriptedHttpServer server;
    boost::shared_ptr<CloudTest::PlainRecognizer> recognizer =
        boost::make_shared<CloudTest::PlainRecognizer>(&engine(),
                                                       boost::make_shared<const Settings>());
    boost::shared_ptr<Listener> listener = boost::make_shared<Listener>();
    boost::shared_ptr<RecognizeProtocol> protocol;
};

std::string fields(const std::vector<std::pair<std::string, std::string>>& namesAndValues) {
    std::string body;
    for (const auto& field : namesAndValues) {
        body += "--" + BOUNDARY + "\r\nContent-Disposition: form-data; name=\"" + field.first +
                "\"\r\n\r\n" + field.second + "\r\n";
    }
    return body;
}

/** A body of the default settings around this sound. */
std::string makeBody(const std::string& contentType, const std::string& sound) {
    return fields({{"uuid", UUID},
                   {"lang", "ru-RU"},
                   {"topic", "general"},
                   {"myll", "0.000000,0.000000"},
                   {"centerll", "0.000000,0.000000"},
                   {"Content-Type", contentType}}) +
           "--" + BOUNDARY +
           "\r\nContent-Disposition: form-data; name=\"audio\"\r\nContent-Type: " + contentType +
           "\r\n\r\n" + sound + "\r\n--" + BOUNDARY + "--\r\n";
}

/** The sound out of such a body, or an empty text. */
std::string cutSound(const std::string& contentType, const std::string& body) {
    const std::string frame = makeBody(contentType, "\n");
    const std::string start = frame.substr(0, frame.find("\n\r\n--" + BOUNDARY + "--"));
    const std::string end = "\r\n--" + BOUNDARY + "--\r\n";
    if (body.compare(0, start.size(), start) != 0 || body.size() < start.size() + end.size() ||
        body.compare(body.size() - end.size(), end.size(), end) != 0) {
        return "";
    }
    return body.substr(start.size(), body.size() - start.size() - end.size());
}

const std::string PCM_TYPE = "audio/x-pcm;bit=16;rate=16000";

TEST_F(RecognizeProtocolTest, IsMadeByItsTypesName) {
    const LogCapture log;
    const auto simple = RecognizeProtocol::create(recognizer.get(), "simple");
    EXPECT_TRUE(boost::dynamic_pointer_cast<Talvox::SimpleRecognizeProtocol>(simple));
    const auto chunked = RecognizeProtocol::create(recognizer.get(), "chunked");
    EXPECT_TRUE(boost::dynamic_pointer_cast<Talvox::ChunkedRecognizeProtocol>(chunked));
    EXPECT_TRUE(log.messages().empty());
    const auto unknown = RecognizeProtocol::create(recognizer.get(), "Chunked");
    EXPECT_TRUE(boost::dynamic_pointer_cast<Talvox::SimpleRecognizeProtocol>(unknown));
    EXPECT_TRUE(log.contains("RecognizeProtocol: unknown type Chunked"));
}

TEST_F(RecognizeProtocolTest, WithoutSoundFailsEveryTime) {
    for (const char* type : {"simple", "chunked"}) {
        for (const std::string& format :
             {Settings::SOUND_FORMAT_PCM, Settings::SOUND_FORMAT_SPEEX}) {
            configureText(Settings::SKS_SOUND_FORMAT, format);
            listener = boost::make_shared<Listener>();
            make(type);
            sendRequest();
            EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured", "ErrorAudio"}));
            sendRequest();
            EXPECT_EQ(listener->getEvents(),
                      (Events{"voiceCaptured", "ErrorAudio", "voiceCaptured", "ErrorAudio"}));
            advanceMs(30000);
            EXPECT_EQ(listener->getEvents().size(), 4U);
        }
    }
    EXPECT_EQ(server.getRequestCount(), 0U);
}

TEST_F(RecognizeProtocolTest, SimpleSendsPcmInOnePiece) {
    server.script({CloudTest::answerGoForward()});
    make("simple");
    handle(makeBuffer({1, 2, 3, 4}));
    handle(makeBuffer({}));
    handle(makeBuffer({5, 6}));
    EXPECT_EQ(server.getConnectionCount(), 0U);
    sendRequest();
    EXPECT_EQ(listener->waitForEvents(2), (Events{"voiceCaptured", "results request-1"}));
    ASSERT_EQ(server.getRequestCount(), 1U);
    const ScriptedHttpServer::Request request = server.getRequest(0);
    EXPECT_EQ(request.line(), std::string("POST /asrgw?uuid=") + UUID + " HTTP/1.1");
    EXPECT_EQ(request.header("content-type"), "multipart/form-data; boundary=" + BOUNDARY);
    EXPECT_EQ(request.body, makeBody(PCM_TYPE, "\x01\x02\x03\x04\x05\x06"));
    EXPECT_TRUE(request.chunkSizes.empty());
    ASSERT_EQ(listener->results->size(), 2U);
    EXPECT_EQ(listener->results->front().getText(), "go forward");
}

TEST_F(RecognizeProtocolTest, ChunkedStreamsPcmAsItComes) {
    server.script({CloudTest::answerGoForward()});
    make("chunked");
    handle(makeBuffer({1, 2, 3, 4}));
    ASSERT_TRUE(server.waitForHead(1));
    const std::string whole = makeBody(PCM_TYPE, "\x01\x02\x03\x04\x05\x06");
    const std::size_t endSize = ("\r\n--" + BOUNDARY + "--\r\n").size();
    ASSERT_TRUE(server.waitForBody(0, whole.size() - endSize - 2));
    EXPECT_EQ(server.getRequest(0).body, whole.substr(0, whole.size() - endSize - 2));
    handle(makeBuffer({}));
    handle(makeBuffer({5, 6}));
    ASSERT_TRUE(server.waitForBody(0, whole.size() - endSize));
    EXPECT_FALSE(server.getRequest(0).complete);
    sendRequest();
    EXPECT_EQ(listener->waitForEvents(2), (Events{"voiceCaptured", "results request-1"}));
    const ScriptedHttpServer::Request request = server.getRequest(0);
    EXPECT_EQ(request.line(), std::string("POST /asrgw_chunked?uuid=") + UUID +
                                  "&action=verbose&Content-Type=" + PCM_TYPE + " HTTP/1.1");
    EXPECT_EQ(request.header("transfer-encoding"), "chunked");
    EXPECT_EQ(request.body, whole);
}

TEST_F(RecognizeProtocolTest, ChunkedLogsItsPcmAndSkipsEmptyBuffers) {
    configure([](Settings& settings) { settings.putInt(Settings::SKS_VERBOSE_LEVEL, 2); });
    const LogCapture log;
    make("chunked");
    handle(makeBuffer({1, 2, 3, 4}));
    handle(makeBuffer({}));
    sendRequest();
    listener->waitForEvents(2);
    EXPECT_TRUE(log.contains("ChunkedRecognizeProtocol writes 4 bytes"));
    EXPECT_FALSE(log.contains("ChunkedRecognizeProtocol writes 0 bytes"));
    EXPECT_TRUE(log.contains("ChunkedRecognizeProtocol closes request"));
}

TEST_F(RecognizeProtocolTest, SendsSpeexInBothWays) {
    configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
    const TestSupport::Samples voice = TestSupport::makeSpeechLike(CloudTest::SAMPLE_RATE, 1000);
    std::vector<std::size_t> pageCounts;
    for (const char* type : {"simple", "chunked"}) {
        listener = boost::make_shared<Listener>();
        server.script({CloudTest::answerGoForward()});
        make(type);
        for (const Sound::SoundDataBuffer& buffer :
             TestSupport::cutIntoBuffers(voice, CloudTest::SAMPLE_RATE)) {
            handle(boost::make_shared<Sound::SoundDataBuffer>(buffer));
        }
        sendRequest();
        EXPECT_EQ(listener->waitForEvents(2), (Events{"voiceCaptured", "results request-1"}));
        const std::string sound =
            cutSound("audio/x-speex", server.getRequest(pageCounts.size()).body);
        const CloudTest::Bytes stream(sound.begin(), sound.end());
        const std::vector<TestSupport::OggPage> pages = TestSupport::readOggPages(stream);
        ASSERT_GT(pages.size(), 2U) << type;
        EXPECT_EQ(TestSupport::readSpeexHeader(pages[0].packets.at(0)).rate, 16000) << type;
        EXPECT_EQ(pages.back().granulePosition, static_cast<int64_t>(voice.size())) << type;
        EXPECT_TRUE(pages.back().last) << type;
        const TestSupport::DecodedSound decoded = TestSupport::decodeWithSpeexdec(stream);
        EXPECT_TRUE(decoded.decoded) << type << decoded.message;
        EXPECT_EQ(decoded.samples.size(), voice.size()) << type;
        pageCounts.push_back(pages.size());
    }
    // Small pages where the sound is streamed.
    EXPECT_GT(pageCounts[1], pageCounts[0]);
}

TEST_F(RecognizeProtocolTest, ChoosesTheEncodingOnceWhenItIsMade) {
    configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_PCM_IF_WIFI);
    auto& network = Network::NetworkManager::getInstance();
    make("simple");
    network.overrideReachability(Network::NetworkManager::METERED);
    handle(makeBuffer({1, 2}));
    sendRequest();
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_EQ(server.getRequest(0).body, makeBody(PCM_TYPE, "\x01\x02"));

    listener = boost::make_shared<Listener>();
    make("simple");
    network.overrideReachability(Network::NetworkManager::WIFI);
    handle(makeConstantBuffer(100));
    sendRequest();
    ASSERT_TRUE(server.waitForRequest(2));
    // The content type follows the setting alone.
    EXPECT_EQ(cutSound(PCM_TYPE, server.getRequest(1).body).substr(0, 4), "OggS");
}

TEST_F(RecognizeProtocolTest, ChunkedKeepsItsEncodingWhenTheNetworkChanges) {
    configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_PCM_IF_WIFI);
    auto& network = Network::NetworkManager::getInstance();
    make("chunked");
    for (const int reachability :
         {Network::NetworkManager::METERED, Network::NetworkManager::WIFI}) {
        network.overrideReachability(reachability);
        handle(makeBuffer({1, 2}));
    }
    network.overrideReachability(Network::NetworkManager::METERED);
    sendRequest();
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_EQ(server.getRequest(0).body, makeBody(PCM_TYPE, "\x01\x02\x01\x02"));

    listener = boost::make_shared<Listener>();
    make("chunked");
    for (const int reachability :
         {Network::NetworkManager::WIFI, Network::NetworkManager::METERED}) {
        network.overrideReachability(reachability);
        handle(makeConstantBuffer(100));
    }
    network.overrideReachability(Network::NetworkManager::WIFI);
    sendRequest();
    ASSERT_TRUE(server.waitForRequest(2));
    const std::string sound = cutSound(PCM_TYPE, server.getRequest(1).body);
    const std::vector<TestSupport::OggPage> pages =
        TestSupport::readOggPages({sound.begin(), sound.end()});
    ASSERT_FALSE(pages.empty());
    EXPECT_TRUE(pages.back().last);
    EXPECT_EQ(pages.back().granulePosition, 2 * 1600);
}

TEST_F(RecognizeProtocolTest, EncodesWithTheQualityOfTheSettingsAndItsOwnPageFill) {
    configureText(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
    const TestSupport::Samples voice = TestSupport::makeSpeechLike(CloudTest::SAMPLE_RATE, 2000);
    const std::vector<Sound::SoundDataBuffer> buffers =
        TestSupport::cutIntoBuffers(voice, CloudTest::SAMPLE_RATE);
    std::size_t requests = 0;
    for (const int quality : {0, 3, 8, 10}) {
        configure([quality](Settings& settings) {
            settings.putInt(Settings::SKS_SPEEX_QUALITY, quality);
        });
        for (const auto& [type, pageFillBytes] : std::vector<std::pair<std::string, int>>{
                 {"simple", Sound::OggSpeexEncoder::PAGE_FILL_BYTES_DFLT}, {"chunked", 512}}) {
            Sound::OggSpeexEncoder reference(buffers.front().getInfo(), quality, pageFillBytes);
            make(type);
            for (const Sound::SoundDataBuffer& buffer : buffers) {
                reference.encode(buffer);
                handle(boost::make_shared<Sound::SoundDataBuffer>(buffer));
            }
            reference.finish();
            sendRequest();
            ASSERT_TRUE(server.waitForRequest(++requests)) << type;
            const std::string sound =
                cutSound("audio/x-speex", server.getRequest(requests - 1).body);
            const CloudTest::Bytes expected = reference.takeOutput(-1)->getData();
            EXPECT_TRUE(expected == CloudTest::Bytes(sound.begin(), sound.end()))
                << type << " with quality " << quality << ": " << sound.size()
                << " bytes instead of " << expected.size();
        }
    }
}

TEST_F(RecognizeProtocolTest, UnknownSoundFormatIsPcm) {
    configureText(Settings::SKS_SOUND_FORMAT, "mp3");
    Network::NetworkManager::getInstance().overrideReachability(Network::NetworkManager::METERED);
    make("simple");
    handle(makeBuffer({1, 2}));
    sendRequest();
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_EQ(server.getRequest(0).body, makeBody(PCM_TYPE, "\x01\x02"));
}

TEST_F(RecognizeProtocolTest, SecondSendRequestDoesNothing) {
    for (const char* type : {"simple", "chunked"}) {
        server.script({Answer::never()});
        listener = boost::make_shared<Listener>();
        make(type);
        handle(makeBuffer({1, 2}));
        sendRequest();
        sendRequest();
        EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured"})) << type;
        const Util::EventLock lock;
        protocol.reset();
    }
}

TEST_F(RecognizeProtocolTest, SendRequestFromInsideItsOwnEventDoesNothing) {
    make("simple");
    listener->hook = [this](const std::string& event) {
        if (event == "voiceCaptured") {
            sendRequest();
        }
    };
    handle(makeBuffer({1, 2}));
    sendRequest();
    listener->waitForEvents(2);
    EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured", "ErrorNetwork"}));
    EXPECT_EQ(server.getRequestCount(), 1U);
}

TEST_F(RecognizeProtocolTest, AnnouncesTheVoiceBeforeItClosesTheRequest) {
    configure([](Settings& settings) { settings.putInt(Settings::SKS_VERBOSE_LEVEL, 2); });
    const TestSupport::LogCapture log;
    make("chunked");
    handle(makeConstantBuffer(1));
    const std::string closes = "ChunkedRecognizeProtocol closes request";
    bool wasOpen = false;
    listener->hook = [&](const std::string& event) {
        wasOpen = wasOpen || (event == "voiceCaptured" && !log.contains(closes));
    };
    sendRequest();
    EXPECT_TRUE(wasOpen);
    EXPECT_TRUE(log.contains(closes));
}

TEST_F(RecognizeProtocolTest, AbandonedInsideItsEventSendsNothing) {
    for (const char* type : {"simple", "chunked"}) {
        listener = boost::make_shared<Listener>();
        make(type);
        listener->hook = [this](const std::string& event) {
            if (event == "voiceCaptured") {
                protocol->abandon();
                protocol.reset();
            }
        };
        handle(makeBuffer({1, 2}));
        sendRequest();
        EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured"})) << type;
    }
    advanceMs(30000);
    kdDrainEventsKOR();
    EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured"}));
    for (std::size_t i = 0; i < server.getRequestCount(); ++i) {
        EXPECT_FALSE(server.getRequest(i).complete);
    }
}

TEST_F(RecognizeProtocolTest, SimpleAssertsThatNoSoundComesLate) {
    server.script({Answer::never()});
    make("simple");
    handle(makeBuffer({1, 2}));
    sendRequest();
    const AssertCapture asserts;
    handle(makeBuffer({3, 4}));
    EXPECT_EQ(asserts.reports(),
              (std::vector<TestSupport::AssertReport>{
                  {"!holder.isWorking()", "talvox/impl/SimpleRecognizeProtocol", 38}}));
    ASSERT_TRUE(server.waitForRequest(1));
    EXPECT_EQ(server.getRequest(0).body, makeBody(PCM_TYPE, "\x01\x02"));
}

TEST_F(RecognizeProtocolTest, SimpleAssertsThatItSendsOneRequestOnly) {
    server.script({Answer::never()});
    make("simple");
    handle(makeBuffer({1, 2}));
    sendRequest();
    ASSERT_TRUE(server.waitForRequest(1));
    const AssertCapture asserts;
    {
        const Util::EventLock lock;
        auto& simple = static_cast<Talvox::SimpleRecognizeProtocol&>(*protocol);
        (simple.*memberOf(TestSupport::MakeHttpRequest()))(makeBuffer({3, 4}));
    }
    EXPECT_EQ(asserts.reports(),
              (std::vector<TestSupport::AssertReport>{
                  {"!holder.isWorking()", "talvox/impl/SimpleRecognizeProtocol", 85}}));
    advanceMs(20000);
    EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured", "ErrorNetwork"}));
    EXPECT_EQ(server.getRequestCount(), 1U);
}

TEST_F(RecognizeProtocolTest, TimesOutTwentySecondsAfterSending) {
    for (const char* type : {"simple", "chunked"}) {
        const std::size_t requests = server.getRequestCount();
        server.script({Answer::never()});
        listener = boost::make_shared<Listener>();
        make(type);
        handle(makeBuffer({1, 2}));
        advanceMs(7000);
        sendRequest();
        ASSERT_TRUE(server.waitForRequest(requests + 1)) << type;
        const LogCapture log;
        advanceMs(19999);
        EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured"})) << type;
        advanceMs(1);
        EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured", "ErrorNetwork"})) << type;
        EXPECT_EQ(log.count("Recognition request timeout"), 1U) << type;
        EXPECT_TRUE(server.waitForClosed(requests + 1)) << type;
    }
}

TEST_F(RecognizeProtocolTest, KeptAfterItsAnswerStillTimesOut) {
    server.script({CloudTest::answerGoForward()});
    make("simple");
    handle(makeBuffer({1, 2}));
    sendRequest();
    listener->waitForEvents(2);
    advanceMs(20000);
    EXPECT_EQ(listener->getEvents(),
              (Events{"voiceCaptured", "results request-1", "ErrorNetwork"}));
}

TEST_F(RecognizeProtocolTest, DroppedAfterItsAnswerIsSilent) {
    server.script({CloudTest::answerGoForward()});
    make("simple");
    listener->hook = [this](const std::string& event) {
        if (event != "voiceCaptured") {
            protocol.reset();
        }
    };
    handle(makeBuffer({1, 2}));
    sendRequest();
    listener->waitForEvents(2);
    kdDrainEventsKOR();
    advanceMs(30000);
    EXPECT_EQ(listener->getEvents(), (Events{"voiceCaptured", "results request-1"}));
}

TEST_F(RecognizeProtocolTest, TriesAgainTwoSecondsAfterAServerError) {
    for (const char* type : {"simple", "chunked"}) {
        const std::size_t requests = server.getRequestCount();
        server.script({Answer::status(500), CloudTest::answerGoForward()});
        listener = boost::make_shared<Listener>();
        make(type);
        handle(makeBuffer({1, 2, 3}));
        sendRequest();
        ASSERT_TRUE(server.waitForRequest(requests + 1)) << type;
        ASSERT_TRUE(advanceUntilHead(requests + 2)) << type;
        EXPECT_EQ(listener->waitForEvents(2), (Events{"voiceCaptured", "results request-1"}))
            << type;
        EXPECT_EQ(server.getRequest(requests).body, server.getRequest(requests + 1).body) << type;
        EXPECT_EQ(server.getRequest(requests + 1).body, makeBody(PCM_TYPE, "\x01\x02\x03")) << type;
    }
}

TEST_F(RecognizeProtocolTest, GivesUpAfterTwoAttempts) {
    server.script({Answer::status(500), Answer::status(500), CloudTest::answerGoForward()});
    make("simple");
    handle(makeBuffer({1, 2}));
    sendRequest();
    ASSERT_TRUE(server.waitForRequest(1));
    ASSERT_TRUE(advanceUntilHead(2));
    EXPECT_EQ(listener->waitForEvents(2), (Events{"voiceCaptured", "ErrorNetwork"}));
    EXPECT_EQ(server.getRequestCount(), 2U);
}

TEST_F(RecognizeProtocolTest, StreamLostInMidUtteranceCostsNoSound) {
    const std::size_t headSize = makeBody(PCM_TYPE, "").size() - 30;
    server.script({Answer::resetAfter(headSize), CloudTest::answerGoForward()});
    make("chunked");
    handle(makeBuffer({1, 2}));
    ASSERT_TRUE(server.waitForClosed(1));
    handle(makeBuffer({3, 4}));
    ASSERT_TRUE(advanceUntilHead(2));
    handle(makeBuffer({5, 6}));
    sendRequest();
    EXPECT_EQ(listener->waitForEvents(2), (Events{"voiceCaptured", "results request-1"}));
    EXPECT_EQ(server.getRequest(1).body, makeBody(PCM_TYPE, "\x01\x02\x03\x04\x05\x06"));
}

TEST_F(RecognizeProtocolTest, KeepsTheSettingsOfItsBeginning) {
    server.script({CloudTest::answerGoForward()});
    make("simple");
    handle(makeBuffer({1, 2}));
    configureText(Settings::SKS_URL, "http://127.0.0.1:1");
    configureText(Settings::SKS_UUID, "");
    sendRequest();
    EXPECT_EQ(listener->waitForEvents(2), (Events{"voiceCaptured", "results request-1"}));
    EXPECT_EQ(server.getRequest(0).body, makeBody(PCM_TYPE, "\x01\x02"));
}

TEST_F(RecognizeProtocolTest, ForgetsExpiredListeners) {
    make("simple");
    const auto second = boost::make_shared<Listener>();
    protocol->addListener(second);
    listener.reset();
    sendRequest();
    EXPECT_EQ(second->getEvents(), (Events{"voiceCaptured", "ErrorAudio"}));
}

}  // namespace
