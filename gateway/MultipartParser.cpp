#include "gateway/MultipartParser.h"

#include <algorithm>
#include <cstring>

#include "core/util/Ascii.h"
#include "gateway/HeaderValue.h"

namespace Gateway {

MultipartParser::MultipartParser(const std::string& boundary, MultipartListener& partListener)
    : delimiter("\r\n--" + boundary), listener(partListener) {}

bool MultipartParser::feed(const char* data, std::size_t size) {
    while (size > 0 && state != State::FAILED) {
        const std::size_t used = step(data, size);
        data += used;
        size -= used;
        position += used;
    }
    return state != State::FAILED;
}

bool MultipartParser::finish() {
    if (state == State::END) {
        state = State::COMPLETE;
    }
    if (state != State::COMPLETE && state != State::FAILED) {
        check("the body ends before its final boundary");
    }
    return state == State::COMPLETE;
}

std::size_t MultipartParser::step(const char* data, std::size_t size) {
    if (state == State::DATA) {
        return stepData(data, size);
    }
    stepByte(data[0]);
    return 1;
}

std::size_t MultipartParser::stepData(const char* data, std::size_t size) {
    if (matched == 0) {
        const void* found = std::memchr(data, '\r', size);
        const std::size_t run =
            found == nullptr ? size
                             : static_cast<std::size_t>(static_cast<const char*>(found) - data);
        if (run > 0) {
            giveData(data, run);
            return run;
        }
    }
    if (data[0] == delimiter[matched]) {
        if (++matched == delimiter.size()) {
            endPart();
        }
        return 1;
    }
    // Only the delimiter's first byte is a CR, so no shorter match can begin inside this one.
    const std::size_t given = matched;
    matched = 0;
    giveData(delimiter.data(), given);
    return 0;
}

// Where the listener refuses data depends on how the body was cut; where the data began does not.
void MultipartParser::giveData(const char* data, std::size_t size) {
    check(listener.onPartData(data, size), dataBegin);
}

void MultipartParser::stepByte(char c) {
    switch (state) {
        case State::OPENING:
            onOpeningByte(c);
            break;
        case State::AFTER_BOUNDARY:
            onAfterBoundaryByte(c);
            break;
        case State::BOUNDARY_LINE_FEED:
            expect(c == '\n', State::HEADER, "a boundary line does not end with CR LF");
            break;
        case State::CLOSING_DASH:
            expect(c == '-', State::END, "a boundary is followed by other bytes");
            break;
        case State::HEADER:
            onHeaderByte(c);
            break;
        case State::HEADER_LINE_FEED:
            if (c == '\n') {
                onHeaderLine();
            } else {
                check("a header line does not end with CR LF");
            }
            break;
        case State::END:
            expect(c == '\r', State::END_LINE_FEED, "bytes follow the final boundary");
            break;
        case State::END_LINE_FEED:
            expect(c == '\n', State::COMPLETE, "bytes follow the final boundary");
            break;
        default:
            check("bytes follow the final boundary");
    }
}

void MultipartParser::expect(bool met, State next, const char* reason) {
    if (met) {
        state = next;
    } else {
        check(reason);
    }
}

void MultipartParser::onOpeningByte(char c) {
    if (c != delimiter[matched]) {
        check("the body does not begin with the boundary that its content type names");
    } else if (++matched == delimiter.size()) {
        state = State::AFTER_BOUNDARY;
    }
}

void MultipartParser::onAfterBoundaryByte(char c) {
    if (c == '-') {
        state = State::CLOSING_DASH;
        return;
    }
    if (++parts > MAX_PARTS) {
        check("the body has too many parts");
        return;
    }
    part = MultipartPart();
    hasDisposition = false;
    headerBytes = 0;
    expect(c == '\r', State::BOUNDARY_LINE_FEED, "a boundary is followed by other bytes");
}

void MultipartParser::onHeaderByte(char c) {
    if (c == '\r') {
        state = State::HEADER_LINE_FEED;
    } else if (c == '\n' || c == '\0') {
        check("a header line holds a control character");
    } else if (++headerBytes > MAX_HEADER_BYTES) {
        check("the headers of a part are too long");
    } else {
        line += c;
    }
}

void MultipartParser::onHeaderLine() {
    state = State::HEADER;
    if (line.empty()) {
        beginPart();
        return;
    }
    const std::size_t colon = line.find(':');
    if (colon == std::string::npos || colon == 0) {
        check("a header line has no name");
    } else {
        storeHeader(Util::toLower(trimBlanks(line.substr(0, colon))),
                    trimBlanks(line.substr(colon + 1)));
    }
    line.clear();
}

void MultipartParser::storeHeader(const std::string& name, const std::string& value) {
    if (name == "content-type") {
        check(part.contentType.empty() ? "" : "a part has two content types");
        part.contentType = value;
    } else if (name == "content-disposition") {
        HeaderValue disposition;
        const bool parsed = HeaderValue::parse(value, disposition);
        const std::string* partName = disposition.find("name");
        if (hasDisposition) {
            check("a part has two dispositions");
        } else if (!parsed || disposition.value != "form-data" || partName == nullptr ||
                   partName->empty()) {
            check("the disposition of a part is not form-data with a name");
        } else {
            hasDisposition = true;
            part.name = *partName;
        }
    } else if (name == "content-transfer-encoding" && Util::toLower(value) != "binary" &&
               Util::toLower(value) != "8bit" && Util::toLower(value) != "7bit") {
        check("a part has a transfer encoding that is not supported");
    }
}

void MultipartParser::beginPart() {
    if (!hasDisposition) {
        check("a part has no disposition");
        return;
    }
    state = State::DATA;
    // A part without data ends with a delimiter whose CR LF is its own, not that of the headers.
    matched = 0;
    dataBegin = position + 1;
    check(listener.onPartBegin(part));
}

void MultipartParser::endPart() {
    state = State::AFTER_BOUNDARY;
    check(listener.onPartEnd());
}

void MultipartParser::check(const std::string& reason) {
    check(reason, position);
}

void MultipartParser::check(const std::string& reason, std::size_t at) {
    if (!reason.empty() && state != State::FAILED) {
        state = State::FAILED;
        error = "at byte " + std::to_string(at) + " of the body: " + reason;
    }
}

}  // namespace Gateway
