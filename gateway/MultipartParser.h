#pragma once

#include <cstddef>
#include <string>

namespace Gateway {

/** What stands in the headers of one part of a body. */
struct MultipartPart {
    std::string name;
    /** The part's own Content-Type, empty when it has none. */
    std::string contentType;
};

/**
 * Receives the parts of a body in order. Each call answers with an empty text to go on, or with a
 * reason in plain words, which becomes the parser's error and ends the parsing.
 */
class MultipartListener {
  public:
    virtual ~MultipartListener() = default;
    virtual std::string onPartBegin(const MultipartPart& part) = 0;
    /** Called any number of times per part, also with a single byte; never with none. */
    virtual std::string onPartData(const char* data, std::size_t size) = 0;
    virtual std::string onPartEnd() = 0;
};

/**
 * Takes a multipart/form-data body apart as it arrives, in pieces of any size.
 *
 * Strict, because it exists to find the mistakes of clients: nothing may stand before the first
 * boundary or after the last, lines end with CR LF, each part has a form-data disposition with a
 * name. Keeps no more than one header line and one boundary of the body.
 */
class MultipartParser {
  public:
    /** Bytes that the headers of one part may have. */
    static constexpr std::size_t MAX_HEADER_BYTES = 8192;
    /** Parts that one body may have. */
    static constexpr unsigned MAX_PARTS = 64;

    /** @param partListener must outlive the parser */
    MultipartParser(const std::string& boundary, MultipartListener& partListener);

    /** @return false from the first error on; further bytes are then ignored */
    bool feed(const char* data, std::size_t size);

    /** Tells that the body is over. @return false when it was not complete */
    bool finish();

    /**
     * Why the body was refused and at which byte, that where the part's data begins where the
     * listener refused some of it; empty while all is well.
     */
    const std::string& getError() const { return error; }

  private:
    enum class State {
        OPENING,
        AFTER_BOUNDARY,
        BOUNDARY_LINE_FEED,
        CLOSING_DASH,
        HEADER,
        HEADER_LINE_FEED,
        DATA,
        END,
        END_LINE_FEED,
        COMPLETE,
        FAILED
    };

    std::size_t step(const char* data, std::size_t size);
    std::size_t stepData(const char* data, std::size_t size);
    void stepByte(char c);
    void expect(bool met, State next, const char* reason);
    void onOpeningByte(char c);
    void onAfterBoundaryByte(char c);
    void onHeaderByte(char c);
    void onHeaderLine();
    void storeHeader(const std::string& name, const std::string& value);
    void beginPart();
    void endPart();
    void giveData(const char* data, std::size_t size);
    void check(const std::string& reason);
    void check(const std::string& reason, std::size_t at);

    /** CR LF, two dashes and the boundary: what ends the data of a part. */
    const std::string delimiter;
    MultipartListener& listener;
    State state = State::OPENING;
    /** Bytes of the delimiter that have been seen and not been given out as data. */
    std::size_t matched = 2;
    std::string line;
    std::size_t headerBytes = 0;
    bool hasDisposition = false;
    MultipartPart part;
    unsigned parts = 0;
    std::size_t position = 0;
    /** Where the data of the part began. */
    std::size_t dataBegin = 0;
    std::string error;
};

}  // namespace Gateway
