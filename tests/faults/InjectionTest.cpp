#include <gtest/gtest.h>

#include <algorithm>
#include <boost/make_shared.hpp>

#include "FaultSession.h"
#include "logcollector/LogCollector.h"
#include "talvox/Settings.h"

namespace FaultTest {

namespace {

using Talvox::Settings;
using Names = std::vector<std::string>;

const std::string SEPARATOR = "--1BEF0A57BE110FD467A";
/** Of a body: uuid, lang, topic, myll, centerll, Content-Type and audio. */
constexpr std::size_t PARTS = 7;
constexpr std::size_t LONG_TEXT = 102400;
const std::string REFUSAL = "Network: a request cannot be sent: ";

/** Texts that would do harm if they went into the head of a request as they are. */
std::vector<std::string> makeHostileTexts() {
    return {"\r\nX-Evil: 1",
            "\nX-Evil: 1",
            "\rX-Evil: 1",
            " HTTP/1.1\r\nX-Evil: 1\r\n\r\nGET /evil HTTP/1.1\r\nHost: evil\r\n\r\n",
            "a b",
            "a\tb",
            std::string("a\0b", 3),
            std::string("\0", 1),
            "\x7F",
            "\xD1\x8F\xE2\x82\xAC",
            "\xFF\xC0\x80",
            "\xC2\x85\xE2\x80\xA8X-Evil: 1",
            "%0d%0aX-Evil:%201",
            "%00",
            "#X-Evil",
            "?a=1&uuid=2#/../..//\\",
            "\r\n--1BEF0A57BE110FD467A\r\nContent-Disposition: form-data; name=\"evil\"\r\n\r\n1",
            "\"; name=\"evil",
            std::string(LONG_TEXT, 'a'),
            std::string(LONG_TEXT, '\n')};
}

/** What cannot be in an address. */
bool isUnsendable(const std::string& text) {
    return std::any_of(text.begin(), text.end(), [](char c) {
        const auto byte = static_cast<unsigned char>(c);
        return byte <= 0x20 || byte == 0x7F || byte == '#';
    });
}

/** The names of the header lines of a head; "?" stands for a line that is none. */
Names getHeaderNames(const std::string& head) {
    Names names;
    std::size_t start = head.find("\r\n") + 2;
    for (std::size_t end = head.find("\r\n", start); end != start; end = head.find("\r\n", start)) {
        const std::string line = head.substr(start, end - start);
        const std::size_t colon = line.find(": ");
        names.push_back(colon == std::string::npos ? "?" : line.substr(0, colon));
        start = end + 2;
    }
    return names;
}

std::size_t countOf(const std::string& text, char c) {
    return static_cast<std::size_t>(std::count(text.begin(), text.end(), c));
}

std::size_t countSeparators(const std::string& body) {
    std::size_t count = 0;
    for (std::size_t at = body.find(SEPARATOR); at != std::string::npos;
         at = body.find(SEPARATOR, at + 1)) {
        ++count;
    }
    return count;
}

/** Bytes of a head that can mean something to a server: none but those of its own lines. */
void expectHead(const std::string& head, const std::string& method, const std::string& host,
                const Names& names) {
    const std::string line = head.substr(0, head.find("\r\n"));
    EXPECT_EQ(0U, line.rfind(method + " /", 0)) << line.substr(0, 200);
    EXPECT_EQ(" HTTP/1.1", line.substr(line.size() - 9));
    EXPECT_EQ(2U, countOf(line, ' '));
    EXPECT_EQ(names, getHeaderNames(head));
    EXPECT_NE(std::string::npos, head.find("\r\nHost: " + host + "\r\n"));
    EXPECT_EQ(names.size() + 2, countOf(head, '\n'));
    EXPECT_EQ(names.size() + 2, countOf(head, '\r'));
    EXPECT_EQ(0U, countOf(head, '\0'));
    EXPECT_EQ(0U, countOf(head, '\t'));
}

/** Settings of a recognition that try to add something to its request. */
class InjectionTest : public FaultSession, public ::testing::WithParamInterface<bool> {
  protected:
    InjectionTest() {
        setChunked(GetParam());
        onStep = [this] {
            if (elapsedMs() == 300) {
                session->stop();
            }
        };
        host = server->getUrl().substr(7);
    }

    static Names names() {
        return GetParam() ? Names{"Host", "Accept", "Content-Type", "Transfer-Encoding"}
                          : Names{"Host", "Accept", "Content-Type", "Content-Length"};
    }

    /** A session as it is configured: one request with what belongs there, or none. */
    void expectOneRequest() {
        const SessionOutcome outcome = run();
        EXPECT_EQ("results (go forward)", outcome.end);
        ASSERT_EQ(1U, outcome.requests);
        const auto request = server->getRequest(server->getRequestCount() - 1);
        expectHead(request.head, "POST", host, names());
        EXPECT_EQ("multipart/form-data; boundary=1BEF0A57BE110FD467A",
                  request.header("Content-Type"));
        EXPECT_TRUE(request.complete);
        EXPECT_EQ(PARTS + 1, countSeparators(request.body));
    }

    void expectRefusal() {
        log->clear();
        const SessionOutcome outcome = run();
        EXPECT_EQ("error ErrorNetwork", outcome.end);
        EXPECT_EQ(0U, outcome.requests);
        EXPECT_EQ(0U, server->getConnectionCount() - connections);
        EXPECT_TRUE(log->containsPart(REFUSAL));
    }

    void expectEither(bool refused) {
        connections = server->getConnectionCount();
        if (refused) {
            expectRefusal();
        } else {
            expectOneRequest();
        }
    }

    /** Each hostile text in one of the engine's settings, at the end of what it holds now. */
    void attack(const std::string& key, const std::string& before) {
        for (const std::string& text : makeHostileTexts()) {
            SCOPED_TRACE(key + ": " + ::testing::PrintToString(text.substr(0, 60)));
            configureText(key, before + text);
            expectEither(isUnsendable(text));
        }
        configureText(key, before);
    }

    std::string host;
    std::size_t connections = 0;
};

TEST_P(InjectionTest, TheAddressAddsNothing) {
    attack(Settings::SKS_URL, server->getUrl() + "/path");
}

TEST_P(InjectionTest, TheUuidAddsNothing) {
    attack(Settings::SKS_UUID, CloudTest::UUID);
}

TEST_P(InjectionTest, AddressesThatMeanSomethingElseAreNotSent) {
    const std::string url = server->getUrl();
    for (const std::string& bad :
         {"http://user:password@" + host, "http://user@" + host, "http://@" + host,
          "http://a%0d%0aX-Evil:@" + host, "gopher://" + host + "/_GET%20/evil", "ftp://" + host,
          std::string("file:///etc/passwd"), "//" + host, host, " " + url, "\r\n" + url,
          url + "/\r\n", "http:" + host, std::string("http://"), std::string("http:///")}) {
        SCOPED_TRACE(bad);
        configureText(Settings::SKS_URL, bad);
        const SessionOutcome outcome = run();
        EXPECT_EQ("error ErrorNetwork", outcome.end);
        EXPECT_EQ(0U, server->getConnectionCount());
        EXPECT_TRUE(log->containsPart("Network: a request"));
        log->clear();
    }
    // Hosts whose names hold what has a meaning in a head, coded.
    for (const std::string& bad :
         {"http://127.0.0.1%0d%0aX-Evil:" + host, "http://127.0.0.1%00." + host}) {
        SCOPED_TRACE(bad);
        configureText(Settings::SKS_URL, bad);
        EXPECT_EQ("error ErrorNetwork", run().end);
        EXPECT_EQ(0U, server->getConnectionCount());
    }
}

/** All texts of both settings but the address, each hostile text in all of them at once. */
TEST_P(InjectionTest, NoOtherTextAddsAnything) {
    for (const std::string& text : makeHostileTexts()) {
        SCOPED_TRACE(::testing::PrintToString(text.substr(0, 60)));
        configure([&text](Settings& settings) {
            for (const auto* spec = Settings::bundleSpecs; spec->name != nullptr; ++spec) {
                if (spec->type == Util::Bundle::STRING && spec->name != Settings::SKS_URL &&
                    spec->name != Settings::SKS_UUID) {
                    settings.putString(spec->name, text);
                }
            }
            settings.putString(Settings::SKS_SOUND_FORMAT, Settings::SOUND_FORMAT_PCM);
        });
        expectEither(false);
    }
}

TEST_P(InjectionTest, TheRecognizersTextsAddNothing) {
    for (const std::string& text : makeHostileTexts()) {
        SCOPED_TRACE(::testing::PrintToString(text.substr(0, 60)));
        recognizerSettings = boost::make_shared<Settings>();
        recognizerSettings->putString(Settings::RS_LANGUAGE, text);
        recognizerSettings->putString(Settings::RS_MODEL, text);
        expectEither(false);
        recognizerSettings->putString(Settings::RS_SESSION_ID, "session" + text);
        expectEither(isUnsendable(text));
    }
}

INSTANTIATE_TEST_SUITE_P(Sessions, InjectionTest, ::testing::Bool(),
                         [](const ::testing::TestParamInfo<bool>& parameters) {
                             return std::string(parameters.param ? "Chunked" : "Simple");
                         });

/** The same for the requests of the usage log. */
class UsageInjectionTest : public FaultSession {
  protected:
    UsageInjectionTest() {
        host = server->getUrl().substr(7);
        server->setDefaultAnswer(TestSupport::Answer::status(200));
        LogCollector::setLoggingEnabled(true);
        LogCollector::startSession("s");
    }

    /** An event with this address and identifier. */
    void send(const std::string& uuid, const std::string& url, const std::string& text = "n") {
        LogCollector::configure(uuid, url);
        LogCollector::logEvent("s", text, {{text, text}});
        rest();
    }

    void expectRequests(std::size_t count) {
        ASSERT_EQ(count, server->getRequestCount());
        if (count > 0) {
            const auto request = server->getRequest(count - 1);
            expectHead(request.head, "GET", host, {"Host", "Accept"});
            EXPECT_TRUE(request.body.empty());
        }
    }

    std::string host;
};

TEST_F(UsageInjectionTest, RecordsAddNothing) {
    std::size_t sent = 0;
    for (const std::string& text : makeHostileTexts()) {
        SCOPED_TRACE(::testing::PrintToString(text.substr(0, 60)));
        send("uuid", server->getUrl() + "/log", text);
        expectRequests(++sent);
    }
}

TEST_F(UsageInjectionTest, AddressAndUuidAddNothing) {
    std::size_t sent = 0;
    for (const std::string& text : makeHostileTexts()) {
        for (const bool inUuid : {false, true}) {
            SCOPED_TRACE(::testing::PrintToString(text.substr(0, 60)));
            log->clear();
            const std::size_t before = LogCollector::getPendingCount();
            send(inUuid ? "uuid" + text : "uuid",
                 server->getUrl() + (inUuid ? "/log" : "/log" + text));
            if (isUnsendable(text)) {
                EXPECT_EQ(before + 1, LogCollector::getPendingCount());
                EXPECT_TRUE(log->containsPart(REFUSAL));
            } else {
                // Those that waited go as well.
                sent += before + 1;
            }
            expectRequests(sent);
        }
    }
}

}  // namespace

}  // namespace FaultTest
