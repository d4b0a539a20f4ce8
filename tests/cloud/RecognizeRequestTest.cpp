#include "talvox/impl/RecognizeRequest.h"

#include <gtest/gtest.h>

#include <boost/make_shared.hpp>

#include "EngineTest.h"
#include "Sounds.h"
#include "core/util/Base64Coder.h"
#include "support/AssertCapture.h"
#include "support/LogCapture.h"

namespace {

using CloudTest::UUID;
using Talvox::RecognizeRequest;
using Talvox::Settings;
using TestSupport::AssertCapture;
using TestSupport::AssertReport;
using TestSupport::LogCapture;

const char* const SOURCE = "talvox/impl/RecognizeRequest";
const std::string BOUNDARY = "1BEF0A57BE110FD467A";

std::string field(const std::string& name, const std::string& value) {
    return "--" + BOUNDARY + "\r\nContent-Disposition: form-data; name=\"" + name + "\"\r\n\r\n" +
           value + "\r\n";
}

std::string audioStart(const std::string& contentType) {
    return "--" + BOUNDARY +
           "\r\nContent-Disposition: form-data; name=\"audio\"\r\nContent-Type: " + contentType +
           "\r\n\r\n";
}

const std::string FINAL_BOUNDARY = "--" + BOUNDARY + "--\r\n";
const std::string PCM_TYPE = "audio/x-pcm;bit=16;rate=16000";

/** What every body begins with, given the settings of the fixture. */
const std::string HEAD = field("uuid", UUID) + field("lang", "en-US") + field("topic", "maps") +
                         field("myll", "55.750000,37.500000") +
                         field("centerll", "0.000000,0.000000");

std::string takeBody(const Network::NetworkTaskWriter& writer) {
    std::string body(writer.getSize(), '\0');
    EXPECT_EQ(writer.read(0, &body[0], body.size()), body.size());
    return body;
}

class RecognizeRequestTest : public ::testing::Test {
  protected:
    RecognizeRequestTest() {
        engine.putString(Settings::SKS_URL, "http://127.0.0.1:1/asrgw");
        engine.putString(Settings::SKS_UUID, UUID);
        recognizer.putString(Settings::RS_LANGUAGE, "en-US");
        recognizer.putString(Settings::RS_MODEL, Settings::MODEL_MAPS);
        recognizer.putLatLon(Settings::RS_MY_LL, {55.75F, 37.5F});
    }

    boost::shared_ptr<RecognizeRequest> makeRequest() const {
        return boost::make_shared<RecognizeRequest>(engine, recognizer);
    }

    boost::shared_ptr<RecognizeRequest> makeStreamedRequest() const {
        boost::shared_ptr<RecognizeRequest> request = makeRequest();
        request->chunked = true;
        request->writer = boost::make_shared<Network::NetworkTaskWriter>();
        return request;
    }

    Settings engine;
    Settings recognizer;
};

TEST_F(RecognizeRequestTest, BeginsWithNothingAttached) {
    const auto request = makeRequest();
    EXPECT_FALSE(request->resultsReceived);
    EXPECT_FALSE(request->writer);
    EXPECT_FALSE(request->chunked);
    EXPECT_FALSE(request->closed);
    EXPECT_EQ(request->contentType, PCM_TYPE);
    ASSERT_TRUE(request->multipart);
    EXPECT_EQ(request->multipart->getBoundary(), BOUNDARY);
    EXPECT_FALSE(request->sound);
    EXPECT_FALSE(request->partsHandler);
    EXPECT_FALSE(request->results);
    EXPECT_EQ(request->requestId, "");
    request->onFinished(200);  // the callback does nothing yet
}

TEST_F(RecognizeRequestTest, TakesTheContentTypeFromTheSoundFormatSetting) {
    engine.putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_SPEEX);
    EXPECT_EQ(makeRequest()->contentType, "audio/x-speex");
    engine.putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_PCM);
    engine.putInt(Settings::SKS_SAMPLE_RATE, 8000);
    EXPECT_EQ(makeRequest()->contentType, "audio/x-pcm;bit=16;rate=8000");
}

TEST_F(RecognizeRequestTest, HasTwoPriorities) {
    const auto request = makeRequest();
    const Network::NetworkTask& task = *request;
    EXPECT_EQ(request->getPriority(), 3);
    EXPECT_EQ(task.getPriority(), 1);
    request->results = boost::make_shared<Talvox::RecognitionResults>();
    EXPECT_EQ(request->getPriority(), 1);
    EXPECT_EQ(task.getPriority(), 1);
    EXPECT_TRUE(task.needToGatherStatistics());
    EXPECT_FALSE(task.recieveResponseBodyByParts());
}

TEST_F(RecognizeRequestTest, IsReadyEvenWithoutIdentifierAndAddressButAsserts) {
    EXPECT_TRUE(makeRequest()->isReadyToPerform());
    engine.putString(Settings::SKS_UUID, "");
    engine.putString(Settings::SKS_URL, "");
    const auto request = makeRequest();
    const AssertCapture asserts;
    EXPECT_TRUE(request->isReadyToPerform());
    EXPECT_EQ(asserts.reports(),
              (std::vector<AssertReport>{{"talvoxSettings.getUuid() != \"\"", SOURCE, 52},
                                         {"talvoxSettings.getUrl() != \"\"", SOURCE, 53}}));
}

TEST_F(RecognizeRequestTest, KeepsTheSettingsThatItWasMadeWith) {
    auto changing = boost::make_shared<Settings>(engine);
    const RecognizeRequest request(*changing, recognizer);
    changing->putString(Settings::SKS_URL, "http://elsewhere");
    changing.reset();
    EXPECT_EQ(request.issueRequest()->getUrl(),
              std::string("http://127.0.0.1:1/asrgw?uuid=") + UUID);
}

TEST_F(RecognizeRequestTest, WholeBodyIsExactToTheByte) {
    const auto request = makeRequest();
    const CloudTest::Bytes sound = {0, 13, 10, '-', '-', 255};
    request->sound = CloudTest::makeBuffer(sound);
    const LogCapture log;
    const auto http = request->issueRequest();
    const std::string url = std::string("http://127.0.0.1:1/asrgw?uuid=") + UUID;
    EXPECT_EQ(http->getUrl(), url);
    EXPECT_EQ(http->getMethod(), "POST");
    EXPECT_EQ(http->getTimeoutMs(), 30000);
    EXPECT_FALSE(http->getFollowRedirects());
    EXPECT_FALSE(http->isChunked());
    EXPECT_EQ(http->getBody(), HEAD + field("Content-Type", PCM_TYPE) + audioStart(PCM_TYPE) +
                                   std::string(sound.begin(), sound.end()) + "\r\n" +
                                   FINAL_BOUNDARY);
    ASSERT_EQ(http->getHeaders().size(), 1U);
    EXPECT_EQ(http->getHeaders()[0].first, "Content-Type");
    EXPECT_EQ(http->getHeaders()[0].second, "multipart/form-data; boundary=" + BOUNDARY);
    EXPECT_TRUE(log.contains("Non-chunked request: " + url));
    EXPECT_TRUE(log.contains("request data size 6"));
}

TEST_F(RecognizeRequestTest, WithoutSoundHasNoSoundFields) {
    const auto request = makeRequest();
    EXPECT_EQ(request->issueRequest()->getBody(), HEAD + FINAL_BOUNDARY);
    request->sound = CloudTest::makeBuffer({});
    EXPECT_EQ(request->issueRequest()->getBody(), HEAD + FINAL_BOUNDARY);
}

TEST_F(RecognizeRequestTest, CarriesTranscriptsBeforeTheSound) {
    const auto request = makeRequest();
    request->results = boost::make_shared<Talvox::RecognitionResults>();
    request->results->emplace_back("hello", -1.0F);
    request->source = "android";
    request->sound = CloudTest::makeBuffer({1, 2});
    EXPECT_EQ(request->issueRequest()->getBody(),
              HEAD +
                  field("transcripts",
                        "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
                        "<Transcripts source=\"android\">\n"
                        "  <Transcript>hello</Transcript>\n"
                        "</Transcripts>\n") +
                  field("Content-Type", PCM_TYPE) + audioStart(PCM_TYPE) + "\x01\x02\r\n" +
                  FINAL_BOUNDARY);
}

TEST_F(RecognizeRequestTest, NoValueBeginsAPartOfItsOwn) {
    const std::string injected =
        "\r\n--" + BOUNDARY + "\r\nContent-Disposition: form-data; name=\"canceled\"\r\n\r\n";
    recognizer.putString(Settings::RS_LANGUAGE, "en-US" + injected + "true");
    // Without the inner one, the halves of an outer one meet.
    recognizer.putString(Settings::RS_MODEL, "--1BEF0A5--" + BOUNDARY + "7BE110FD467A--maps");
    const auto request = makeRequest();
    request->results = boost::make_shared<Talvox::RecognitionResults>();
    request->results->emplace_back("hello" + injected, -1.0F);
    request->source = "android";
    const LogCapture log;
    const std::string body = request->issueRequest()->getBody();
    const std::string rest = "\r\n\r\nContent-Disposition: form-data; name=\"canceled\"\r\n\r\n";
    EXPECT_EQ(body, field("uuid", UUID) + field("lang", "en-US" + rest + "true") +
                        field("topic", "--maps") + field("myll", "55.750000,37.500000") +
                        field("centerll", "0.000000,0.000000") +
                        field("transcripts",
                              "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
                              "<Transcripts source=\"android\">\n"
                              "  <Transcript>hello" +
                                  rest + "</Transcript>\n</Transcripts>\n") +
                        FINAL_BOUNDARY);
    for (const char* const name : {"lang", "topic", "transcripts"}) {
        EXPECT_TRUE(log.contains(std::string("RecognizeRequest: ") + name +
                                 " holds the separator of the request, removing it"))
            << name;
    }
}

TEST_F(RecognizeRequestTest, IsTheSameAtEveryAttempt) {
    const auto request = makeRequest();
    request->sound = CloudTest::makeConstantBuffer(7);
    EXPECT_EQ(request->issueRequest()->getBody(), request->issueRequest()->getBody());
}

TEST_F(RecognizeRequestTest, AssertsWhatIsMissingAndBuildsItEmptyButRefusesIt) {
    engine.putString(Settings::SKS_UUID, "");
    recognizer.putString(Settings::RS_LANGUAGE, "");
    recognizer.putString(Settings::RS_MODEL, "");
    const auto request = makeRequest();
    const AssertCapture asserts;
    const auto http = request->issueRequest();
    EXPECT_EQ(asserts.reports(),
              (std::vector<AssertReport>{{"!talvoxSettings.getUuid().empty()", SOURCE, 168},
                                         {"!recognizerSettings.getLanguage().empty()", SOURCE, 170},
                                         {"!recognizerSettings.getModel().empty()", SOURCE, 172}}));
    EXPECT_EQ(http->getBody(), field("uuid", "") + field("lang", "") + field("topic", "") +
                                   field("myll", "55.750000,37.500000") +
                                   field("centerll", "0.000000,0.000000") + FINAL_BOUNDARY);
    EXPECT_EQ(http->getRefusal(), "the uuid is empty");
}

TEST_F(RecognizeRequestTest, EachMissingFieldIsReasonEnoughToRefuse) {
    EXPECT_EQ(makeRequest()->issueRequest()->getRefusal(), "");
    EXPECT_EQ(makeStreamedRequest()->issueRequest()->getRefusal(), "");
    const AssertCapture asserts;
    recognizer.putString(Settings::RS_MODEL, "");
    EXPECT_EQ(makeRequest()->issueRequest()->getRefusal(), "the model is empty");
    EXPECT_EQ(makeStreamedRequest()->issueRequest()->getRefusal(), "the model is empty");
    recognizer.putString(Settings::RS_LANGUAGE, "");
    EXPECT_EQ(makeRequest()->issueRequest()->getRefusal(), "the language is empty");
    EXPECT_EQ(makeStreamedRequest()->issueRequest()->getRefusal(), "the language is empty");
}

TEST_F(RecognizeRequestTest, StreamedBodyWithoutLanguageAndModelAssertsAndIsWritten) {
    recognizer.putString(Settings::RS_LANGUAGE, "");
    recognizer.putString(Settings::RS_MODEL, "");
    const auto request = makeStreamedRequest();
    const AssertCapture asserts;
    request->writeBodyStart();
    EXPECT_EQ(asserts.reports(),
              (std::vector<AssertReport>{{"!recognizerSettings.getLanguage().empty()", SOURCE, 170},
                                         {"!recognizerSettings.getModel().empty()", SOURCE, 172}}));
    EXPECT_EQ(takeBody(*request->writer),
              field("uuid", UUID) + field("lang", "") + field("topic", "") +
                  field("myll", "55.750000,37.500000") + field("centerll", "0.000000,0.000000") +
                  field("Content-Type", PCM_TYPE) + audioStart(PCM_TYPE));
}

TEST_F(RecognizeRequestTest, StreamedRequestHasAWriterInsteadOfABody) {
    const auto request = makeStreamedRequest();
    const LogCapture log;
    const auto http = request->issueRequest();
    const std::string url = std::string("http://127.0.0.1:1/asrgw_chunked?uuid=") + UUID +
                            "&action=verbose&Content-Type=" + PCM_TYPE;
    EXPECT_EQ(http->getUrl(), url);
    EXPECT_TRUE(http->isChunked());
    EXPECT_EQ(http->getWriter(), request->writer);
    EXPECT_EQ(http->getBody(), "");
    ASSERT_EQ(http->getHeaders().size(), 1U);
    EXPECT_EQ(http->getHeaders()[0].second, "multipart/form-data; boundary=" + BOUNDARY);
    EXPECT_TRUE(log.contains("Chunked request: " + url));
}

TEST_F(RecognizeRequestTest, StreamedBodyIsExactToTheByte) {
    const auto request = makeStreamedRequest();
    request->writeBodyStart();
    const std::string start = HEAD + field("Content-Type", PCM_TYPE) + audioStart(PCM_TYPE);
    EXPECT_EQ(takeBody(*request->writer), start);
    request->write("ab", 2);
    request->write("c", 1);
    EXPECT_FALSE(request->closed);
    request->close(true);
    EXPECT_TRUE(request->closed);
    EXPECT_TRUE(request->writer->isClosed());
    EXPECT_EQ(takeBody(*request->writer), start + "abc\r\n" + FINAL_BOUNDARY);
}

TEST_F(RecognizeRequestTest, CancelledStreamSaysSoAfterTheSound) {
    const auto request = makeStreamedRequest();
    request->write("abc", 3);
    request->close(false);
    EXPECT_EQ(takeBody(*request->writer), "abc\r\n" + field("canceled", "true") + FINAL_BOUNDARY);
}

/** Under an engine that logs everything. */
class VerboseRecognizeRequestTest : public RecognizeRequestTest {
  protected:
    VerboseRecognizeRequestTest() { setVerbosity(2); }
    ~VerboseRecognizeRequestTest() override {
        Talvox::Talvox::getInstance().setTalvoxSettings(boost::make_shared<Settings>());
    }

    static void setVerbosity(int level) {
        const auto settings = boost::make_shared<Settings>();
        settings->putInt(Settings::SKS_VERBOSE_LEVEL, level);
        Talvox::Talvox::getInstance().setTalvoxSettings(settings);
    }
};

TEST_F(VerboseRecognizeRequestTest, LogsTheTranscriptsBeforeTheSoundsSize) {
    const auto request = makeRequest();
    request->results = boost::make_shared<Talvox::RecognitionResults>();
    request->results->emplace_back("hello", 0.5F);
    request->source = "android";
    request->sound = CloudTest::makeBuffer({1, 2});
    const LogCapture log;
    request->issueRequest();
    ASSERT_EQ(log.messages().size(), 3U);
    EXPECT_EQ(log.messages()[1],
              "resultsXml: <?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
              "<Transcripts source=\"android\">\n"
              "  <Transcript confidence=\"0.5\">hello</Transcript>\n"
              "</Transcripts>\n");
    EXPECT_EQ(log.messages()[2], "request data size 2");
    setVerbosity(1);
    request->issueRequest();
    EXPECT_EQ(log.messages().size(), 5U);
}

TEST_F(VerboseRecognizeRequestTest, LogsThatTheStreamIsCancelled) {
    const LogCapture log;
    const auto finished = makeStreamedRequest();
    finished->close(true);
    EXPECT_TRUE(log.messages().empty());
    const auto cancelled = makeStreamedRequest();
    cancelled->close(false);
    cancelled->close(false);
    EXPECT_EQ(log.messages(), (std::vector<std::string>{"Writing cancel field to request"}));
    setVerbosity(1);
    makeStreamedRequest()->close(false);
    EXPECT_EQ(log.messages().size(), 1U);
}

TEST_F(RecognizeRequestTest, SecondCloseDoesNothing) {
    const auto request = makeStreamedRequest();
    request->close(true);
    const std::string body = takeBody(*request->writer);
    request->close(false);
    EXPECT_EQ(takeBody(*request->writer), body);
}

TEST_F(RecognizeRequestTest, StreamWithoutIdentifierAssertsAndGoesOn) {
    engine.putString(Settings::SKS_UUID, "");
    const auto request = makeStreamedRequest();
    const AssertCapture asserts;
    request->writeBodyStart();
    EXPECT_EQ(asserts.reports(),
              (std::vector<AssertReport>{{"!talvoxSettings.getUuid().empty()", SOURCE, 63}}));
    EXPECT_EQ(takeBody(*request->writer).find(field("uuid", "")), 0U);
}

TEST_F(RecognizeRequestTest, StreamWithoutWriterReportsTheNullPointer) {
    const auto request = makeRequest();
    const AssertCapture asserts;
    request->write("x", 1);
    ASSERT_EQ(asserts.count(), 1U);
    EXPECT_EQ(asserts.reports()[0].condition, "px != 0");
}

TEST_F(RecognizeRequestTest, StreamWithoutWriterIsClosedAllTheSame) {
    const auto request = makeRequest();
    const AssertCapture asserts;
    request->close(false);
    EXPECT_TRUE(request->closed);
    EXPECT_GT(asserts.count(), 0U);
    for (const AssertReport& report : asserts.reports()) {
        EXPECT_EQ(report.condition, "px != 0");
        EXPECT_EQ(report.path, "talvox/impl/IsPresent");
    }
}

// --- The answer ---

TEST_F(RecognizeRequestTest, MissingResponseReportsTheNullPointer) {
    const auto request = makeRequest();
    const AssertCapture asserts;
    request->onResponseRecieved(nullptr);
    ASSERT_EQ(asserts.count(), 1U);
    EXPECT_EQ(asserts.reports()[0].condition, "px != 0");
    EXPECT_FALSE(request->resultsReceived);
}

boost::shared_ptr<Network::HttpResponse> makeResponse(const std::string& document,
                                                      const std::string& requestId) {
    auto response = boost::make_shared<Network::HttpResponse>(200);
    response->addHeader("X-ASRGW-Recognition-Results",
                        Util::Base64Coder::encode({document.begin(), document.end()}));
    response->addHeader("X-KVRequestId", requestId);
    return response;
}

const char* const GOOD_DOCUMENT =
    "<recognitionResults success=\"1\"><variant confidence=\"0.9\">hello</variant>"
    "</recognitionResults>";

TEST_F(RecognizeRequestTest, TakesResultsAndIdentifierFromTheHeaders) {
    const auto request = makeRequest();
    request->onResponseRecieved(makeResponse(GOOD_DOCUMENT, "r-1"));
    EXPECT_TRUE(request->resultsReceived);
    EXPECT_EQ(request->requestId, "r-1");
    ASSERT_TRUE(request->results);
    ASSERT_EQ(request->results->size(), 1U);
    EXPECT_EQ(request->results->front().getText(), "hello");
}

TEST_F(RecognizeRequestTest, WithoutSuccessHasEmptyResults) {
    const auto request = makeRequest();
    request->onResponseRecieved(makeResponse("<recognitionResults success=\"0\"/>", "r-2"));
    EXPECT_TRUE(request->resultsReceived);
    ASSERT_TRUE(request->results);
    EXPECT_TRUE(request->results->empty());
    EXPECT_EQ(request->requestId, "r-2");
}

TEST_F(RecognizeRequestTest, UnreadableResultsHideTheIdentifierToo) {
    const auto request = makeRequest();
    request->onResponseRecieved(makeResponse("<recognitionResults", "r-3"));
    EXPECT_FALSE(request->resultsReceived);
    EXPECT_FALSE(request->results);
    EXPECT_EQ(request->requestId, "");
}

TEST_F(RecognizeRequestTest, WithoutResultsHeaderStillReadsTheIdentifier) {
    const auto request = makeRequest();
    const auto response = boost::make_shared<Network::HttpResponse>(500);
    response->addHeader("x-kvrequestid", "r-4");
    request->onResponseRecieved(response);
    EXPECT_FALSE(request->resultsReceived);
    EXPECT_FALSE(request->results);
    EXPECT_EQ(request->requestId, "r-4");
}

TEST_F(RecognizeRequestTest, CallsBackAtTheEndWhateverTheCode) {
    const auto request = makeRequest();
    std::vector<std::pair<bool, std::string>> calls;
    request->callback = [&calls](const boost::shared_ptr<const Talvox::RecognitionResults>& results,
                                 const std::string& id) {
        calls.emplace_back(results != nullptr, id);
    };
    const LogCapture log;
    request->onFinished(-1);
    request->onResponseRecieved(makeResponse(GOOD_DOCUMENT, "r-5"));
    request->onFinished(404);
    EXPECT_EQ(calls, (std::vector<std::pair<bool, std::string>>{{false, ""}, {true, "r-5"}}));
    EXPECT_TRUE(log.contains("RecognizeRequest::onFinished: res code -1"));
    EXPECT_TRUE(log.contains("RecognizeRequest::onFinished: res code 404"));
}

TEST_F(RecognizeRequestTest, CallbackMayDropTheRequest) {
    auto request = makeRequest();
    int calls = 0;
    request->callback = [&](const boost::shared_ptr<const Talvox::RecognitionResults>&,
                            const std::string&) {
        request.reset();
        ++calls;
    };
    request->onFinished(200);
    EXPECT_EQ(calls, 1);
    EXPECT_FALSE(request);
}

TEST_F(RecognizeRequestTest, ReadingInPartsIsNotImplemented) {
    const auto request = makeRequest();
    int calls = 0;
    request->callback = [&calls](const boost::shared_ptr<const Talvox::RecognitionResults>&,
                                 const std::string&) { ++calls; };
    const AssertCapture asserts;
    request->onBytesReceived({1, 2, 3});
    EXPECT_EQ(asserts.count(), 0U);
    request->partsHandler = boost::make_shared<int>(0);
    request->onBytesReceived({1, 2, 3});
    EXPECT_EQ(asserts.reports(),
              (std::vector<AssertReport>{{"false && \"Not implemented\"", SOURCE, 294}}));
    request->onFinished(200);
    EXPECT_EQ(calls, 0);
}

}  // namespace
