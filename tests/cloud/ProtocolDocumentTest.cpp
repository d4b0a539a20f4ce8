// docs/PROTOCOL.md against the client: each example is what the client sends or what it reads.
#include <gmock/gmock.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <fstream>
#include <future>
#include <map>

#include "SessionTest.h"
#include "core/network/NetworkManager.h"
#include "core/util/UrlCoder.h"
#include "logcollector/LogCollector.h"
#include "talvox/impl/RecognizeRequest.h"
#include "talvox/impl/ResultDocument.h"

namespace {

using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::Pair;
using ::testing::StartsWith;
using ::testing::UnorderedElementsAre;

using Talvox::Settings;
using TestSupport::Answer;

const std::string CRLF = "\r\n";
const std::string SOUND = "<sound>";
const std::string BOUNDARY_START = "\r\n--";
const std::string LOG_MESSAGE = "&logmessage=";

/** The lines of each fenced example, by the name in the comment before it. */
std::map<std::string, std::vector<std::string>> readExamples() {
    const std::string mark = "<!-- example: ";
    const std::string fence = "```";
    std::map<std::string, std::vector<std::string>> examples;
    std::ifstream page(PROTOCOL_DOCUMENT);
    std::string name;
    bool isInside = false;
    for (std::string line; std::getline(page, line);) {
        if (line.compare(0, mark.size(), mark) == 0) {
            name = line.substr(mark.size(), line.rfind(" -->") - mark.size());
        } else if (line.compare(0, fence.size(), fence) == 0) {
            isInside = !isInside && !name.empty();
            name = isInside ? name : std::string();
        } else if (isInside) {
            examples[name].push_back(line);
        }
    }
    return examples;
}

std::vector<std::string> getLines(const std::string& name) {
    return readExamples()[name];
}

/** The bytes of an example: each of its lines ends with CRLF. */
std::string getWire(const std::string& name) {
    std::string bytes;
    for (const std::string& line : getLines(name)) {
        bytes += line + CRLF;
    }
    EXPECT_FALSE(bytes.empty()) << "no example " << name;
    return bytes;
}

/** An example of one line, as it stands. */
std::string getLine(const std::string& name) {
    const std::vector<std::string> lines = getLines(name);
    EXPECT_EQ(lines.size(), 1U) << name;
    return lines.empty() ? std::string() : lines[0];
}

/** The header's value in an example of an answer. */
std::string getHeader(const std::string& name, const std::string& header) {
    for (const std::string& line : getLines(name)) {
        if (line.compare(0, header.size() + 2, header + ": ") == 0) {
            return line.substr(header.size() + 2);
        }
    }
    ADD_FAILURE() << "no header " << header << " in " << name;
    return {};
}

/** `bytes` with the words `<sound>` where the sound is. */
std::string hideSound(const std::string& bytes, std::string& sound) {
    const std::string start = "name=\"audio\"\r\nContent-Type: ";
    const std::size_t head = bytes.find(start);
    const std::size_t begin = head == std::string::npos ? head : bytes.find("\r\n\r\n", head);
    const std::size_t end = begin == std::string::npos ? begin : bytes.rfind(BOUNDARY_START);
    if (end == std::string::npos || end < begin + 4) {
        return bytes;
    }
    sound = bytes.substr(begin + 4, end - begin - 4);
    return bytes.substr(0, begin + 4) + SOUND + bytes.substr(end);
}

class ProtocolDocumentTest : public CloudTest::SessionTest {
  protected:
    ProtocolDocumentTest() { server.setDefaultAnswer(Answer::raw(getWire("answer"))); }

    /** What the page's examples are made with. */
    static boost::shared_ptr<Settings> makeRecognizerSettings() {
        auto settings = boost::make_shared<Settings>();
        settings->putString(Settings::RS_LANGUAGE, "en-US");
        settings->putString(Settings::RS_MODEL, Settings::MODEL_MAPS);
        settings->putString(Settings::RS_SESSION_ID, "ride-7");
        settings->putLatLon(Settings::RS_MY_LL, {55.75F, 37.5F});
        return settings;
    }

    void listen(bool streamed, const std::string& format) {
        configure([&](Settings& settings) {
            settings.putBoolean(Settings::SKS_STREAMING, streamed);
            settings.putString(Settings::SKS_SOUND_FORMAT, format);
        });
        events = boost::make_shared<CloudTest::EventRecorder>();
        session = engine().createRecognizer(events, makeRecognizerSettings());
        session->start();
    }

    /** 200 ms of sound, sent and answered. */
    void recognise(bool streamed, const std::string& format) {
        listen(streamed, format);
        play(200);
        session->stop();
    }

    /** A request with the port that the page names, and without its sound. */
    std::string takeRequest(std::size_t index, std::string& sound) const {
        const TestSupport::ScriptedHttpServer::Request request = server.getRequest(index);
        std::string bytes = hideSound(request.head + request.body, sound);
        const std::string host = server.getUrl().substr(std::string("http://").size());
        const std::size_t position = bytes.find(host);
        return position == std::string::npos
                   ? bytes
                   : bytes.replace(position, host.size(), "127.0.0.1:8090");
    }
};

TEST_F(ProtocolDocumentTest, EachExampleIsComparedHere) {
    std::vector<std::string> names;
    for (const auto& example : readExamples()) {
        names.push_back(example.first);
    }
    EXPECT_THAT(names,
                UnorderedElementsAre("answer", "answer-busy", "answer-nothing", "canceled",
                                     "document", "document-nothing", "log-record", "log-request",
                                     "request-streamed", "request-whole", "transcripts"));
}

TEST_F(ProtocolDocumentTest, WholeRequestIsTheExample) {
    recognise(false, Settings::SOUND_FORMAT_PCM);
    ASSERT_TRUE(events->waitForEnds());
    std::string sound;
    EXPECT_EQ(takeRequest(0, sound), getWire("request-whole"));
    EXPECT_EQ(sound, CloudTest::getConstantBytes(0) + CloudTest::getConstantBytes(100));
}

TEST_F(ProtocolDocumentTest, StreamedRequestIsTheExample) {
    listen(true, Settings::SOUND_FORMAT_SPEEX);
    play(100);
    ASSERT_TRUE(server.waitForBody(0, 1)) << "nothing was sent while the user speaks";
    play(100);
    session->stop();
    ASSERT_TRUE(events->waitForEnds());
    std::string sound;
    EXPECT_EQ(takeRequest(0, sound), getWire("request-streamed"));
    EXPECT_THAT(sound, StartsWith("OggS"));
    EXPECT_GT(server.getRequest(0).chunkSizes.size(), 1U);
}

TEST_F(ProtocolDocumentTest, SpeexThatTheConnectionDecidesIsAnnouncedAsPcm) {
    Network::NetworkManager::getInstance().overrideReachability(Network::NetworkManager::METERED);
    for (const bool streamed : {false, true}) {
        recognise(streamed, Settings::SOUND_FORMAT_PCM_IF_WIFI);
        ASSERT_TRUE(events->waitForEnds());
        std::string sound;
        EXPECT_THAT(takeRequest(streamed ? 1 : 0, sound),
                    ::testing::HasSubstr("name=\"audio\"\r\nContent-Type: "
                                         "audio/x-pcm;bit=16;rate=16000\r\n\r\n<sound>\r\n"));
        EXPECT_THAT(sound, StartsWith("OggS"));
    }
}

TEST_F(ProtocolDocumentTest, CanceledFieldIsTheExample) {
    Talvox::RecognizeRequest request(*engine().getTalvoxSettings(), *makeRecognizerSettings());
    request.chunked = true;
    request.writer = boost::make_shared<Network::NetworkTaskWriter>();
    request.writeBodyStart();
    request.close(false);
    std::string body(request.writer->getSize(), '\0');
    ASSERT_EQ(request.writer->read(0, &body[0], body.size()), body.size());
    EXPECT_THAT(body, EndsWith("\r\n\r\n\r\n" + getWire("canceled")));
}

TEST_F(ProtocolDocumentTest, TranscriptsAreTheExample) {
    Talvox::RecognizeRequest request(*engine().getTalvoxSettings(), *makeRecognizerSettings());
    request.results = boost::make_shared<Talvox::RecognitionResults>(Talvox::RecognitionResults{
        {"go forward", 0.85F}, {"go for it", Talvox::RecognitionResult::UNKNOWN_CONFIDENCE}});
    request.source = "com.example.recognizer";
    request.defaultLanguage = "en-US";
    request.topic = "web_search";
    std::string transcripts = getWire("transcripts");
    // In the document each line ends with LF; the CRLF of the last one belongs to the part.
    transcripts.erase(std::remove(transcripts.begin(), transcripts.end(), '\r'), transcripts.end());
    const std::string body = request.issueRequest()->getBody();
    const std::string part = "name=\"transcripts\"\r\n\r\n" + transcripts + BOUNDARY_START;
    EXPECT_NE(body.find(part), std::string::npos) << body;
}

TEST_F(ProtocolDocumentTest, AnswerIsReadAsThePageSays) {
    recognise(false, Settings::SOUND_FORMAT_PCM);
    ASSERT_TRUE(events->waitForEnds());
    ASSERT_THAT(events->texts().back(), "results");
    std::vector<std::pair<std::string, float>> hypotheses;
    for (const Talvox::RecognitionResult& result : *events->recognition()->getResults()) {
        hypotheses.emplace_back(result.getText(), result.getConfidence());
    }
    EXPECT_THAT(hypotheses, ElementsAre(Pair("go forward", 0.95F), Pair("rock & roll", 0.5F)));
    EXPECT_EQ(events->recognition()->getRequestId(), getHeader("answer", "x-kvrequestid"));
}

TEST_F(ProtocolDocumentTest, AnswerWithoutHypothesesHasResultsAllTheSame) {
    server.setDefaultAnswer(Answer::raw(getWire("answer-nothing")));
    recognise(true, Settings::SOUND_FORMAT_PCM);
    ASSERT_TRUE(events->waitForEnds());
    ASSERT_THAT(events->texts().back(), "results");
    EXPECT_TRUE(events->recognition()->getResults()->empty());
}

TEST_F(ProtocolDocumentTest, HeadersHoldTheDocumentsShown) {
    const char* const header = "x-asrgw-recognition-results";
    for (const auto& [document, answer] :
         {std::pair("document", "answer"), std::pair("document-nothing", "answer-nothing")}) {
        std::vector<unsigned char> bytes;
        ASSERT_TRUE(Util::Base64Coder::decode(getHeader(answer, header), bytes));
        EXPECT_EQ(std::string(bytes.begin(), bytes.end()), getLine(document));
    }
}

TEST_F(ProtocolDocumentTest, BusyAnswerIsTriedAgainOnce) {
    server.script({Answer::raw(getWire("answer-busy")), Answer::raw(getWire("answer-busy"))});
    recognise(false, Settings::SOUND_FORMAT_PCM);
    for (int i = 0; i < 150 && !events->waitForEnds(1, std::chrono::milliseconds(20)); ++i) {
        advanceMs(100);
    }
    EXPECT_EQ(events->texts().back(), "error ErrorNetwork");
    EXPECT_EQ(events->errorReason(), "HTTP status 503 (the service is busy)");
    EXPECT_EQ(server.getRequestCount(), 2U);
    std::string sound;
    EXPECT_EQ(takeRequest(0, sound), takeRequest(1, sound));
}

TEST_F(ProtocolDocumentTest, LogRequestIsTheExample) {
    std::promise<void> delivered;
    LogCollector::setDeliveredCallback([&delivered] { delivered.set_value(); });
    LogCollector::configure(CloudTest::UUID, server.getUrl() + "/log");
    LogCollector::setLoggingEnabled(true);
    LogCollector::startSession("main");
    LogCollector::logEvent("main", "screenOpened", {{"screen", "a;b"}, {"from", "menu"}});
    LogCollector::setLoggingEnabled(false);
    EXPECT_EQ(delivered.get_future().wait_for(TestSupport::SERVER_WAIT_DFLT),
              std::future_status::ready);
    LogCollector::setDeliveredCallback({});
    std::string none;
    EXPECT_EQ(takeRequest(0, none), getWire("log-request"));
    const std::string line = server.getRequest(0).line();
    const std::size_t begin = line.find(LOG_MESSAGE) + LOG_MESSAGE.size();
    EXPECT_EQ(Util::UrlCoder::urlDecodeString(line.substr(begin, line.find(' ', begin) - begin)),
              getLine("log-record"));
}

}  // namespace
