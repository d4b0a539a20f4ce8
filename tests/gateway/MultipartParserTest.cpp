#include "gateway/MultipartParser.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <vector>

#include "core/network/HttpRequest.h"

namespace {

using Gateway::MultipartParser;

struct SeenPart {
    std::string name;
    std::string contentType;
    std::string data;
    bool ended = false;

    bool operator==(const SeenPart& other) const {
        return name == other.name && contentType == other.contentType && data == other.data &&
               ended == other.ended;
    }
};

void PrintTo(const SeenPart& seen, std::ostream* out) {
    *out << seen.name << " (" << seen.contentType << ") " << seen.data
         << (seen.ended ? "" : " open");
}

class Recorder : public Gateway::MultipartListener {
  public:
    std::string onPartBegin(const Gateway::MultipartPart& part) override {
        parts.push_back({part.name, part.contentType, "", false});
        return part.name == refusedName ? "not this one" : "";
    }
    std::string onPartData(const char* data, std::size_t size) override {
        EXPECT_GT(size, 0U);
        parts.back().data.append(data, size);
        return parts.back().data == refusedData ? "not this" : "";
    }
    std::string onPartEnd() override {
        parts.back().ended = true;
        return parts.back().name == refusedEnd ? "too short" : "";
    }

    std::vector<SeenPart> parts;
    std::string refusedName = "-";
    std::string refusedData = "-";
    std::string refusedEnd = "-";
};

/** Parses a body at once; the error when it is refused. */
std::string refusalOf(const std::string& body) {
    Recorder recorder;
    MultipartParser parser("B", recorder);
    parser.feed(body.data(), body.size());
    parser.finish();
    return parser.getError();
}

const char* const TWO_PARTS =
    "--B\r\n"
    "Content-Disposition: form-data; name=\"uuid\"\r\n"
    "\r\n"
    "u1\r\n"
    "--B\r\n"
    "Content-Disposition: form-data; name=\"audio\"\r\n"
    "Content-Type: audio/x-pcm;bit=16;rate=16000\r\n"
    "\r\n"
    "\r\n--\r\n--C\r\r\n--\r\n"
    "--B--\r\n";

std::vector<SeenPart> twoParts() {
    return {{"uuid", "", "u1", true},
            {"audio", "audio/x-pcm;bit=16;rate=16000", "\r\n--\r\n--C\r\r\n--", true}};
}

std::string onePart(const std::string& headers, const std::string& data = "x") {
    return "--B\r\n" + headers + "\r\n" + data + "\r\n--B--\r\n";
}

}  // namespace

TEST(MultipartParser, ReadsAWholeBody) {
    Recorder recorder;
    MultipartParser parser("B", recorder);
    const std::string body = TWO_PARTS;
    EXPECT_TRUE(parser.feed(body.data(), body.size()));
    EXPECT_TRUE(parser.finish());
    EXPECT_EQ("", parser.getError());
    EXPECT_EQ(twoParts(), recorder.parts);
}

TEST(MultipartParser, ReadsTheSamePartsWhereverTheBodyIsCutInTwo) {
    const std::string body = TWO_PARTS;
    for (std::size_t cut = 0; cut <= body.size(); ++cut) {
        Recorder recorder;
        MultipartParser parser("B", recorder);
        ASSERT_TRUE(parser.feed(body.data(), cut));
        ASSERT_TRUE(parser.feed(body.data() + cut, body.size() - cut));
        ASSERT_TRUE(parser.finish()) << "cut at " << cut;
        ASSERT_EQ(twoParts(), recorder.parts) << "cut at " << cut;
    }
}

TEST(MultipartParser, ReadsTheSamePartsFromPiecesOfAnySize) {
    const std::string body = TWO_PARTS;
    for (std::size_t piece = 1; piece < 20; ++piece) {
        Recorder recorder;
        MultipartParser parser("B", recorder);
        for (std::size_t i = 0; i < body.size(); i += piece) {
            ASSERT_TRUE(parser.feed(body.data() + i, std::min(piece, body.size() - i)));
        }
        ASSERT_TRUE(parser.finish());
        ASSERT_EQ(twoParts(), recorder.parts) << "pieces of " << piece;
    }
}

TEST(MultipartParser, RefusesEveryBodyThatBreaksOff) {
    const std::string body = TWO_PARTS;
    // Only the line end after the final boundary may be missing as a whole.
    for (std::size_t size = 0; size < body.size() - 2; ++size) {
        Recorder recorder;
        MultipartParser parser("B", recorder);
        EXPECT_TRUE(parser.feed(body.data(), size));
        EXPECT_FALSE(parser.finish()) << "after " << size;
        EXPECT_NE(std::string::npos,
                  parser.getError().find("the body ends before its final boundary"));
    }
    EXPECT_EQ("", refusalOf(body.substr(0, body.size() - 2)));
    EXPECT_NE("", refusalOf(body.substr(0, body.size() - 1)));
}

TEST(MultipartParser, GivesEmptyPartsWithoutData) {
    Recorder recorder;
    MultipartParser parser("B", recorder);
    const std::string body = onePart("Content-Disposition: form-data; name=a\r\n", "");
    EXPECT_TRUE(parser.feed(body.data(), body.size()));
    EXPECT_TRUE(parser.finish());
    EXPECT_EQ((std::vector<SeenPart>{{"a", "", "", true}}), recorder.parts);
}

TEST(MultipartParser, PassesEveryByteValueThrough) {
    std::string data;
    for (int i = 0; i < 1024; ++i) {
        data += static_cast<char>(i * 7);
    }
    Recorder recorder;
    MultipartParser parser("B", recorder);
    const std::string body = onePart("Content-Disposition: form-data; name=a\r\n", data);
    EXPECT_TRUE(parser.feed(body.data(), body.size()));
    EXPECT_TRUE(parser.finish());
    ASSERT_EQ(1U, recorder.parts.size());
    EXPECT_EQ(data, recorder.parts[0].data);
}

TEST(MultipartParser, ReadsHeadersOfAnyCaseAndWidth) {
    Recorder recorder;
    MultipartParser parser("B", recorder);
    const std::string body = onePart(
        "X-Other: 1\r\nCONTENT-TYPE:a/b\r\n"
        "content-disposition :  Form-Data;filename=f ; NAME = \"a \\\"b\\\"\" \r\n");
    EXPECT_TRUE(parser.feed(body.data(), body.size()));
    EXPECT_TRUE(parser.finish()) << parser.getError();
    EXPECT_EQ((std::vector<SeenPart>{{"a \"b\"", "a/b", "x", true}}), recorder.parts);
}

TEST(MultipartParser, ReadsWhatTheKitBuilds) {
    using Builder = Network::HttpRequest::MultipartBuilder;
    const boost::shared_ptr<Builder> builder = Builder::create("1BEF0A57BE110FD467A");
    builder->addField("uuid", "u1", false, false, "");
    builder->addField("audio", std::string("\r\n--\0x", 6), false, false, "audio/x-speex");
    const std::string body = builder->getEncodedContent();
    Recorder recorder;
    MultipartParser parser(builder->getBoundary(), recorder);
    EXPECT_TRUE(parser.feed(body.data(), body.size()));
    EXPECT_TRUE(parser.finish()) << parser.getError();
    EXPECT_EQ(
        (std::vector<SeenPart>{{"uuid", "", "u1", true},
                               {"audio", "audio/x-speex", std::string("\r\n--\0x", 6), true}}),
        recorder.parts);
}

TEST(MultipartParser, SaysWhatIsWrongAndWhere) {
    EXPECT_EQ(
        "at byte 0 of the body: the body does not begin with the boundary that its content type "
        "names",
        refusalOf("preamble\r\n--B--\r\n"));
    EXPECT_EQ("at byte 3 of the body: a boundary is followed by other bytes",
              refusalOf("--Bx\r\n"));
    EXPECT_EQ("at byte 4 of the body: a boundary line does not end with CR LF",
              refusalOf("--B\rx"));
    EXPECT_EQ("at byte 4 of the body: a boundary is followed by other bytes", refusalOf("--B-x"));
    EXPECT_EQ("at byte 7 of the body: bytes follow the final boundary", refusalOf("--B--\r\nx"));
    EXPECT_EQ("at byte 5 of the body: bytes follow the final boundary", refusalOf("--B--x"));
    EXPECT_EQ("at byte 6 of the body: bytes follow the final boundary", refusalOf("--B--\rx"));
}

TEST(MultipartParser, NamesThePlaceOfRefusedDataHoweverItArrives) {
    const std::string body =
        "--B\r\nContent-Disposition: form-data; name=a\r\n\r\nabcdef\r\n--B--\r\n";
    const std::size_t place = body.find("\r\n\r\n") + 4;
    for (const std::size_t piece : {std::size_t{1}, std::size_t{7}, body.size()}) {
        Recorder recorder;
        recorder.refusedData = "abcdef";
        MultipartParser parser("B", recorder);
        for (std::size_t at = 0; at < body.size(); at += piece) {
            parser.feed(body.data() + at, std::min(piece, body.size() - at));
        }
        EXPECT_EQ("at byte " + std::to_string(place) + " of the body: not this", parser.getError());
    }
}

TEST(MultipartParser, RefusesMalformedHeaders) {
    const std::string disposition = "Content-Disposition: form-data; name=a\r\n";
    for (const auto& refused : std::vector<std::pair<std::string, std::string>>{
             {"", "a part has no disposition"},
             {"Content-Type: a/b\r\n", "a part has no disposition"},
             {"no colon\r\n", "a header line has no name"},
             {": value\r\n", "a header line has no name"},
             {"a: b\n", "a header line holds a control character"},
             {"a: b\rc", "a header line does not end with CR LF"},
             {disposition + disposition, "a part has two dispositions"},
             {disposition + "Content-Type: a/b\r\nContent-Type: c/d\r\n",
              "a part has two content types"},
             {"Content-Disposition: attachment; name=a\r\n",
              "the disposition of a part is not form-data with a name"},
             {"Content-Disposition: form-data\r\n",
              "the disposition of a part is not form-data with a name"},
             {"Content-Disposition: form-data; name=\"\"\r\n",
              "the disposition of a part is not form-data with a name"},
             {"Content-Disposition: form-data; name=\"a\r\n",
              "the disposition of a part is not form-data with a name"},
             {disposition + "Content-Transfer-Encoding: base64\r\n",
              "a part has a transfer encoding that is not supported"}}) {
        const std::string error = refusalOf(onePart(refused.first));
        EXPECT_NE(std::string::npos, error.find(refused.second)) << refused.first << ": " << error;
    }
    EXPECT_EQ("", refusalOf(onePart(disposition + "Content-Transfer-Encoding: binary\r\n")));
}

TEST(MultipartParser, LimitsHeadersAndParts) {
    const std::string disposition = "Content-Disposition: form-data; name=a\r\n";
    const std::string filler = "X: ";
    const std::size_t room =
        MultipartParser::MAX_HEADER_BYTES - (disposition.size() - 2) - filler.size();
    const std::string fits = disposition + filler + std::string(room, 'x') + "\r\n";
    const std::string exceeds = disposition + filler + std::string(room + 1, 'x') + "\r\n";
    EXPECT_EQ("", refusalOf(onePart(fits)));
    EXPECT_NE(std::string::npos,
              refusalOf(onePart(exceeds)).find("the headers of a part are too long"));

    const std::string part = "--B\r\n" + disposition + "\r\nx\r\n";
    std::string body;
    for (unsigned i = 0; i < MultipartParser::MAX_PARTS; ++i) {
        body += part;
    }
    EXPECT_EQ("", refusalOf(body + "--B--\r\n"));
    EXPECT_NE(std::string::npos,
              refusalOf(body + part + "--B--\r\n").find("the body has too many parts"));
}

TEST(MultipartParser, StopsWhereItsListenerRefuses) {
    const std::string body = TWO_PARTS;
    for (int when = 0; when < 3; ++when) {
        Recorder recorder;
        recorder.refusedName = when == 0 ? "uuid" : "-";
        recorder.refusedData = when == 1 ? "u1" : "-";
        recorder.refusedEnd = when == 2 ? "uuid" : "-";
        MultipartParser parser("B", recorder);
        EXPECT_FALSE(parser.feed(body.data(), body.size()));
        EXPECT_FALSE(parser.finish());
        EXPECT_NE(std::string::npos, parser.getError().find(when == 2 ? "too short" : "not this"));
        EXPECT_EQ(1U, recorder.parts.size());
    }
}

TEST(MultipartParser, IgnoresWhatFollowsAnError) {
    Recorder recorder;
    MultipartParser parser("B", recorder);
    EXPECT_FALSE(parser.feed("x", 1));
    const std::string error = parser.getError();
    const std::string body = TWO_PARTS;
    EXPECT_FALSE(parser.feed(body.data(), body.size()));
    EXPECT_EQ(error, parser.getError());
    EXPECT_TRUE(recorder.parts.empty());
}
