#include "core/network/HttpRequest.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "core/network/HttpResponse.h"

using Network::HttpRequest;
using Network::HttpResponse;
using ::testing::ElementsAre;
using ::testing::Pair;
using ::testing::StartsWith;

namespace {

TEST(HttpRequest, CarriesWhatItWasMadeOf) {
    const auto request = HttpRequest::create("http://host/a b", "POST", 30000, true);
    EXPECT_EQ("http://host/a b", request->getUrl());
    EXPECT_EQ("POST", request->getMethod());
    EXPECT_EQ(30000, request->getTimeoutMs());
    EXPECT_TRUE(request->getFollowRedirects());
    EXPECT_FALSE(request->isChunked());
    EXPECT_EQ(nullptr, request->getWriter());
    EXPECT_EQ("", request->getBody());
    EXPECT_TRUE(request->getHeaders().empty());
}

TEST(HttpRequest, AnnouncesTheBoundary) {
    const auto request = HttpRequest::create("http://host/", "POST", 1, false);
    request->setBoundary("1BEF0A57BE110FD467A");
    request->addBoundaryHeader();
    EXPECT_THAT(
        request->getHeaders(),
        ElementsAre(Pair("Content-Type", "multipart/form-data; boundary=1BEF0A57BE110FD467A")));
}

TEST(HttpRequest, SetsBodyAndBoundaryTogether) {
    const auto request = HttpRequest::create("http://host/", "POST", 1, false);
    request->setBody("B", std::string("a\0b", 3));
    EXPECT_EQ(std::string("a\0b", 3), request->getBody());
    EXPECT_THAT(request->getHeaders(),
                ElementsAre(Pair("Content-Type", "multipart/form-data; boundary=B")));
}

TEST(HttpRequest, RefusesMalformedHeaders) {
    const auto request = HttpRequest::create("http://host/", "GET", 1, false);
    for (const char* const name : {"", "a b", "a:", "a;", "a\r\nb", "a\x7F"}) {
        request->addHeader(name, "value");
    }
    for (const char* const value : {"a\rb", "a\nb", "\x01", "a\tb", "\x7F"}) {
        request->addHeader("name", value);
    }
    request->addHeader("name", std::string(1, '\0'));
    EXPECT_TRUE(request->getHeaders().empty());
    request->addHeader("X-Name", "\xD1\x8F; a: b");
    EXPECT_THAT(request->getHeaders(), ElementsAre(Pair("X-Name", "\xD1\x8F; a: b")));
}

TEST(HttpRequest, SaysWhyNothingCanBeSentToAUrl) {
    const auto fault = [](const std::string& url) { return HttpRequest::findUrlFault(url); };
    EXPECT_EQ("", fault("http://127.0.0.1:8090"));
    EXPECT_EQ("", fault("HTTPS://host/a@b?c=d@e"));
    EXPECT_EQ("", fault("http://[::1]:65535/"));
    for (const char* const url : {"http://a b", "http://a/\n", "http://a/\x7F", "http://a/\t"}) {
        EXPECT_EQ("has a blank or control character", fault(url)) << url;
    }
    EXPECT_EQ("has a blank or control character", fault(std::string("http://a/\0", 10)));
    for (const char* const url : {"", "foo", "ftp://host/", "file:///etc/hostname", "127.0.0.1"}) {
        EXPECT_EQ("is neither http nor https", fault(url)) << url;
    }
    for (const char* const url : {"http://ann@host", "http://a:b@host", "http:///ann@host"}) {
        EXPECT_EQ("has a user name", fault(url)) << url;
    }
    EXPECT_EQ("has a #, after which nothing is sent", fault("http://host/?uuid=a#b"));
    for (const char* const url :
         {"http://", "http://[::1", "http://host:99999/", "http://host:port/", "http://?a=b"}) {
        EXPECT_THAT(fault(url), StartsWith("is not well-formed (")) << url;
    }
}

TEST(HttpRequest, LooksAtEachAddressWhateverTheLastOneWas) {
    const auto fault = [](const std::string& url) { return HttpRequest::findUrlFault(url); };
    for (const char* const url : {"http://[::1", "http://host:99999/", "http://host:port"}) {
        EXPECT_EQ("", fault("http://host/?a=b"));
        EXPECT_EQ("", fault("http://host?a=c"));
        EXPECT_THAT(fault(url), StartsWith("is not well-formed (")) << url;
        EXPECT_THAT(fault(std::string(url) + "?a=b"), StartsWith("is not well-formed (")) << url;
    }
    EXPECT_EQ("", fault("http://host/?a=" + std::string(100000, 'b')));
    EXPECT_THAT(fault("http://host:port?a=" + std::string(100000, 'b')),
                StartsWith("is not well-formed ("));
    EXPECT_EQ("has a blank or control character", fault("http://host/?a=b c"));
}

TEST(MultipartBuilder, BuildsABodyByteForByte) {
    const auto builder = HttpRequest::MultipartBuilder::create("1BEF0A57BE110FD467A");
    EXPECT_EQ("1BEF0A57BE110FD467A", builder->getBoundary());
    builder->addField("uuid", "f00", false, false, "");
    builder->addField("audio", std::string("\r\n\0\xFF--", 6), false, false,
                      "audio/x-pcm;bit=16;rate=16000");
    EXPECT_EQ(std::string("--1BEF0A57BE110FD467A\r\n"
                          "Content-Disposition: form-data; name=\"uuid\"\r\n"
                          "\r\n"
                          "f00\r\n"
                          "--1BEF0A57BE110FD467A\r\n"
                          "Content-Disposition: form-data; name=\"audio\"\r\n"
                          "Content-Type: audio/x-pcm;bit=16;rate=16000\r\n"
                          "\r\n") +
                  std::string("\r\n\0\xFF--", 6) +
                  "\r\n"
                  "--1BEF0A57BE110FD467A--\r\n",
              builder->getEncodedContent());
}

TEST(MultipartBuilder, EndsABodyWithoutFields) {
    EXPECT_EQ("--B--\r\n", HttpRequest::MultipartBuilder::create("B")->getEncodedContent());
}

TEST(MultipartBuilder, GivesThePiecesOfAStreamedBody) {
    const auto builder = HttpRequest::MultipartBuilder::create("B");
    EXPECT_EQ("--B\r\nContent-Disposition: form-data; name=\"n\"\r\n\r\n",
              builder->startField("n", false, false, ""));
    EXPECT_EQ("\r\n", builder->endField());
    EXPECT_EQ("--B--\r\n", builder->endEncodedContent());
    // None of them changes the content.
    EXPECT_EQ("--B--\r\n", builder->getEncodedContent());
}

TEST(MultipartBuilder, AnnouncesFilesAndEncodings) {
    const auto builder = HttpRequest::MultipartBuilder::create("B");
    EXPECT_EQ(
        "--B\r\n"
        "Content-Disposition: form-data; name=\"n\"; filename=\"n\"\r\n"
        "Content-Type: text/plain\r\n"
        "Content-Transfer-Encoding: base64\r\n"
        "\r\n",
        builder->startField("n", true, true, "text/plain"));
}

TEST(MultipartBuilder, KeepsNamesInTheirPlace) {
    const auto builder = HttpRequest::MultipartBuilder::create("B");
    EXPECT_EQ("--B\r\nContent-Disposition: form-data; name=\"a%22b%0D%0Ac\\d\"\r\n\r\n",
              builder->startField("a\"b\r\nc\\d", false, false, ""));
}

TEST(HttpResponse, FindsHeadersWithoutRegardToCase) {
    HttpResponse response(200);
    response.addHeader("X-KvRequestId", "abc");
    EXPECT_EQ(200, response.getStatus());
    EXPECT_EQ("abc", response.getHeader("x-kvrequestid"));
    EXPECT_EQ("abc", response.getHeader("X-KVREQUESTID"));
    EXPECT_EQ(std::nullopt, response.getHeader("x-kvrequestid2"));
    EXPECT_EQ(std::nullopt, response.getHeader(""));
}

TEST(HttpResponse, KeepsTheFirstOfAName) {
    HttpResponse response(200);
    response.addHeader("a", "first");
    response.addHeader("A", "second");
    EXPECT_EQ("first", response.getHeader("a"));
}

TEST(HttpResponse, CutsWhiteSpaceAroundValues) {
    HttpResponse response(200);
    response.addHeader("a", " \t one  two \r\n");
    response.addHeader("b", " \t");
    EXPECT_EQ("one  two", response.getHeader("a"));
    EXPECT_EQ("", response.getHeader("b"));
}

}  // namespace
