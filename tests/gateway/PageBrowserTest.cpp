// The page of the last sessions in a real browser.
#include <gmock/gmock.h>

#include <filesystem>
#include <memory>

#include "gateway/Bodies.h"
#include "gateway/HttpClient.h"
#include "gateway/RecordedSpeech.h"
#include "gateway/Server.h"
#include "support/Browser.h"
#include "support/LogCapture.h"
#include "support/ScratchDirectory.h"

namespace {

using namespace GatewayTest;
using ::testing::Contains;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using TestSupport::Browser;
using Json = nlohmann::json;

/** Texts that would run a script, load something, close an element or turn the text around them. */
constexpr const char* SCRIPT = "</script><script>window.broken=1</script>";
constexpr const char* IMAGE = "<img src=x onerror=window.broken=1>'\"&amp;";
constexpr const char* TURNED = "\xe2\x80\xae<b>turned</b>";

/** The texts of all elements that a selector finds in the newest session. */
std::string textsOf(const std::string& selector) {
    return "[...document.querySelectorAll('#sessions > :first-child " + selector +
           "')].map((one) => one.textContent)";
}

class PageBrowserTest : public ::testing::Test {
  protected:
    void SetUp() override {
        if (!TestSupport::ChildProcess::isInstalled(Browser::PROGRAM)) {
            GTEST_SKIP() << "needs the package " << Browser::PROGRAM;
        }
        gateway = start(0);
        std::filesystem::create_directory(directory.path("browser"));
        browser = std::make_unique<Browser>(directory.path("browser"));
        browser->open(gateway->getUrl() + "/");
        browser->waitFor("document.querySelector('#link').dataset.state === 'live'");
    }

    static std::unique_ptr<Gateway::Server> start(uint16_t port) {
        Gateway::ServerOptions options;
        options.port = port;
        options.decoderWaitMs = 60000;
        options.hasPage = true;
        options.recordFile = "/dev/null";
        auto server = std::make_unique<Gateway::Server>(options);
        EXPECT_EQ("", server->start());
        return server;
    }

    /** Nothing that a client sent has become more than text. */
    void expectHarmless() {
        EXPECT_EQ(Json("undefined"), browser->evaluate("typeof window.broken"));
        EXPECT_EQ(Json(1), browser->evaluate("document.querySelectorAll('script').length"));
        EXPECT_EQ(Json(0),
                  browser->evaluate("document.querySelectorAll('main img, main b').length"));
        EXPECT_THAT(browser->getComplaints(), ElementsAre());
    }

    TestSupport::LogCapture log;
    const TestSupport::ScratchDirectory directory;
    std::unique_ptr<Gateway::Server> gateway;
    std::unique_ptr<Browser> browser;
};

TEST_F(PageBrowserTest, FollowsASessionWhileItRuns) {
    EXPECT_EQ(Json(false), browser->evaluate("document.querySelector('#no-sessions').hidden"));
    const std::string content = bodyWithSound(toPcm(readRecording("goforward.raw")), PCM16K);
    HttpClient client(gateway->getPort());
    client.send(requestHead("/asrgw_chunked?uuid=u1&sessionId=ride-7"));
    client.sendChunk(content.substr(0, 20000));
    browser->waitFor("document.querySelectorAll('[data-state=running] .piece').length >= 1");
    EXPECT_EQ(Json::array({"running"}), browser->evaluate(textsOf(".status")));
    EXPECT_EQ(Json(true), browser->evaluate("document.querySelector('#no-sessions').hidden"));
    const Json pieces = browser->evaluate("document.querySelectorAll('.piece').length");
    client.sendChunk(content.substr(20000, 20000));
    browser->waitFor("document.querySelectorAll('[data-state=running] .piece').length > " +
                     pieces.dump());
    client.sendChunk(content.substr(40000));
    client.sendChunk("");
    EXPECT_EQ(200, client.read().status);
    browser->waitFor("document.querySelector('[data-state=ended] .hypothesis')");
    EXPECT_EQ(Json::array({"200"}), browser->evaluate(textsOf(".status")));
    EXPECT_EQ(Json("go forward ten meters"), browser->evaluate(textsOf(".hypothesis"))[0]);
    EXPECT_EQ(Json::array({"ride-7"}), browser->evaluate(textsOf("[data-name=session]")));
    EXPECT_EQ(Json(1), browser->evaluate("document.querySelectorAll('.session').length"));
    EXPECT_THAT(browser->evaluate(textsOf("li .number"))[0].get<std::string>(),
                ::testing::MatchesRegex("[01]\\.[0-9][0-9]"));
    expectHarmless();
}

TEST_F(PageBrowserTest, PlaysTheSound) {
    HttpClient client(gateway->getPort());
    client.send(requestHead("/asrgw_chunked?uuid=u1"));
    client.sendChunk(bodyWithSound(std::string(32000, '\0'), PCM16K));
    client.sendChunk("");
    EXPECT_EQ(200, client.read().status);
    browser->waitFor("document.querySelector('[data-state=ended] .player button')");
    const Json length = browser->evaluate(
        "new Promise((resolve, reject) => {"
        "  document.querySelector('.player button').click();"
        "  const observer = new MutationObserver(() => {"
        "    const audio = document.querySelector('audio');"
        "    if (!audio) return;"
        "    observer.disconnect();"
        "    audio.addEventListener('error', () => reject(audio.error));"
        "    audio.addEventListener('ended', () => resolve(audio.duration));"
        "  });"
        "  observer.observe(document, {subtree: true, childList: true});"
        "})");
    EXPECT_EQ(Json(1), length);
    expectHarmless();
}

TEST_F(PageBrowserTest, ShowsWhatClientsSendAsText) {
    Gateway::RequestHead head;
    head.path = "/asrgw";
    head.uuid = SCRIPT;
    head.sessionId = IMAGE;
    Gateway::SessionList& sessions = *gateway->getSessions();
    const Gateway::SessionList::Id id = sessions.begin(head);
    Gateway::RequestSummary summary;
    summary.language = SCRIPT;
    summary.topic = IMAGE;
    summary.soundType = TURNED;
    summary.transcripts = IMAGE;
    summary.remark = IMAGE;
    summary.refusal = SCRIPT;
    summary.hypotheses = {{IMAGE, 0.5}, {TURNED, 7}};
    sessions.end(id, 400, summary, 0);
    sessions.addRecord(SCRIPT, IMAGE, 200);
    browser->waitFor("document.querySelector('td.record')");
    EXPECT_EQ(Json::array({SCRIPT}), browser->evaluate(textsOf("[data-name=uuid]")));
    EXPECT_EQ(Json::array({IMAGE}), browser->evaluate(textsOf("[data-name=session]")));
    EXPECT_EQ(Json::array({SCRIPT}), browser->evaluate(textsOf("[data-name=language]")));
    EXPECT_EQ(Json::array({IMAGE}), browser->evaluate(textsOf("[data-name=topic]")));
    EXPECT_EQ(Json::array({TURNED}), browser->evaluate(textsOf("[data-name=type]")));
    EXPECT_EQ(Json::array({IMAGE}), browser->evaluate(textsOf("[data-name=transcripts]")));
    EXPECT_EQ(Json::array({SCRIPT, IMAGE}), browser->evaluate(textsOf("p.said")));
    EXPECT_EQ(Json::array({IMAGE, TURNED}), browser->evaluate(textsOf(".hypothesis")));
    EXPECT_EQ(Json(SCRIPT), browser->evaluate("document.querySelector('td.uuid').textContent"));
    EXPECT_EQ(Json(IMAGE), browser->evaluate("document.querySelector('td.record').textContent"));
    expectHarmless();
}

TEST_F(PageBrowserTest, ShowsHostileRequestsAsText) {
    HttpClient client(gateway->getPort());
    client.send(requestHead("/asrgw?uuid=%3Cscript%3Ewindow.broken%3D1%3C/script%3E%00%ff", 3));
    client.send("<b>");
    EXPECT_EQ(400, client.read().status);
    HttpClient logger(gateway->getPort());
    logger.send(
        "GET /log?uuid=u1&logmessage=%3Cimg%20src%3Dx%20onerror%3Dwindow.broken%3D1%3E "
        "HTTP/1.1\r\nHost: a\r\n\r\n");
    EXPECT_EQ(200, logger.read().status);
    browser->waitFor("document.querySelector('td.record')");
    EXPECT_THAT(browser->evaluate(textsOf("[data-name=uuid]"))[0].get<std::string>(),
                HasSubstr("<script>window.broken=1</script>"));
    EXPECT_EQ(Json("<img src=x onerror=window.broken=1>"),
              browser->evaluate("document.querySelector('td.record').textContent"));
    expectHarmless();
}

TEST_F(PageBrowserTest, RunsNoScriptButItsOwn) {
    for (const char* attempt :
         {"document.createElement('script').src = 'data:text/javascript,window.broken=1'",
          "document.body.setAttribute('onclick', 'window.broken=1')",
          "document.body.innerHTML = '<img src=x onerror=window.broken=1>'",
          "document.write('<script>window.broken=1</script>')"}) {
        const Json result = browser->evaluate(attempt);
        ASSERT_TRUE(result.contains("exception")) << attempt;
        EXPECT_THAT(result["exception"].get<std::string>(), HasSubstr("Trusted"));
    }
    const Json fetched = browser->evaluate("fetch('http://127.0.0.2:1/')");
    EXPECT_THAT(fetched.dump(), HasSubstr("Failed to fetch"));
    EXPECT_THAT(browser->getComplaints(), Contains(HasSubstr("Content Security Policy")));
    EXPECT_EQ(Json("undefined"), browser->evaluate("typeof window.broken"));
}

TEST_F(PageBrowserTest, SaysWhenTheGatewayIsGoneAndStartsAgainWithAnother) {
    Gateway::RequestHead head;
    head.uuid = "before";
    gateway->getSessions()->begin(head);
    browser->waitFor("document.querySelector('.session')");
    const uint16_t port = gateway->getPort();
    gateway.reset();
    browser->waitFor("document.querySelector('#link').dataset.state === 'lost'");
    EXPECT_EQ(Json("the gateway does not answer; trying again"),
              browser->evaluate("document.querySelector('#link').textContent"));
    EXPECT_EQ(Json::array({"before"}), browser->evaluate(textsOf("[data-name=uuid]")));
    gateway = start(port);
    head.uuid = "after";
    gateway->getSessions()->begin(head);
    browser->waitFor("document.querySelector('#link').dataset.state === 'live'");
    EXPECT_EQ(Json::array({"after"}), browser->evaluate(textsOf("[data-name=uuid]")));
    EXPECT_EQ(Json(1), browser->evaluate("document.querySelectorAll('.session').length"));
}

}  // namespace
