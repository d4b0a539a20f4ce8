/**
 * @file
 * One HTTP request and the builder of multipart bodies.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>
#include <utility>
#include <vector>

#include "core/Export.h"
#include "core/network/NetworkTaskWriter.h"

namespace Network {

/** What is to be sent in one attempt. Built by a task, then not changed. */
class KORVEL_CORE_API HttpRequest {
  public:
    /**
     * Builds bodies of type multipart/form-data, byte for byte: each field is
     * `--BOUNDARY CRLF headers CRLF CRLF value CRLF`, the end is `--BOUNDARY-- CRLF`. In names, a
     * double quote, CR and LF are written as %22, %0D and %0A, so that none can leave its place.
     */
    class KORVEL_CORE_API MultipartBuilder {
      public:
        /** A builder without fields. The boundary is not checked. */
        static boost::shared_ptr<MultipartBuilder> create(const std::string& boundary);

        /** The boundary, without the leading hyphens. */
        const std::string& getBoundary() const { return boundary; }

        /**
         * Appends a whole field to the encoded content; the arguments are those of `startField`.
         */
        void addField(const std::string& name, const std::string& value, bool asFile, bool base64,
                      const std::string& contentType);

        /**
         * The text that opens a field; the content is not changed.
         * @param asFile      adds a file name equal to the field's name
         * @param base64      announces `Content-Transfer-Encoding: base64`; the value is then
         *                    expected to be encoded already
         * @param contentType adds a `Content-Type` line unless empty
         */
        std::string startField(const std::string& name, bool asFile, bool base64,
                               const std::string& contentType) const;

        /** The text that ends a field. */
        std::string endField() const;

        /** The text that ends the whole body. */
        std::string endEncodedContent() const;

        /** All fields added so far and the end of the body. */
        std::string getEncodedContent() const;

      private:
        explicit MultipartBuilder(std::string boundaryText);

        std::string boundary;
        std::string content;
    };

    /**
     * @param url       used as it stands. A URL that `findUrlFault` objects to makes the attempt
     *                  fail without being sent.
     * @param method    "GET" or "POST"
     * @param timeoutMs bounds each wait for the peer, on the platform clock: for the connection,
     *                  for taking bytes that are ready, and for the answer after the last of them.
     *                  The time in which a streamed body is still being written does not count.
     *                  Values below 1 mean no bound.
     * @param followRedirects follow 3xx answers; never done for a request with a body
     */
    static boost::shared_ptr<HttpRequest> create(const std::string& url, const std::string& method,
                                                 int timeoutMs, bool followRedirects);

    /**
     * Why no request can be sent to a URL: blanks, control characters, another scheme than http
     * and https, a user name, a fragment ("#"), no host, a port out of range. Resolves no name and
     * opens no connection. Any thread.
     * @return the rest of a sentence that begins with the URL, such as "has a user name"; empty if
     *         requests can be sent
     */
    static std::string findUrlFault(const std::string& url);

    /**
     * True: the body is what `setWriter` gives, sent with chunked transfer coding. When the final
     * answer comes before the writer is closed, the body is ended there and the exchange with it;
     * the writer stays usable, but nobody reads what is written later.
     */
    void setChunked(bool value) { chunked = value; }
    bool isChunked() const { return chunked; }

    /** The body's source for a chunked request. */
    void setWriter(const boost::shared_ptr<NetworkTaskWriter>& source) { writer = source; }
    const boost::shared_ptr<NetworkTaskWriter>& getWriter() const { return writer; }

    /** The boundary that `addBoundaryHeader` announces. */
    void setBoundary(const std::string& text) { boundary = text; }

    /** Adds the header `Content-Type: multipart/form-data; boundary=...` with the set boundary. */
    void addBoundaryHeader();

    /** Sets boundary, boundary header and the whole body. */
    void setBody(const std::string& boundaryText, std::string content);

    /** Adds a header; one with a control character in it is refused and logged. */
    void addHeader(const std::string& name, const std::string& value);

    /**
     * Marks a request that must not be sent: the attempt fails before anything leaves the device,
     * and the task ends with `NO_REQUEST` and no retry. The first reason counts.
     * @param reason says what is wrong, such as "the language is empty"; not empty
     */
    void refuse(const std::string& reason);
    /** The reason given to `refuse`; empty for a request that may be sent. */
    const std::string& getRefusal() const { return refusal; }

    /** What was given to the constructor and the operations above. */
    const std::string& getUrl() const { return url; }
    const std::string& getMethod() const { return method; }
    int getTimeoutMs() const { return timeoutMs; }
    bool getFollowRedirects() const { return followRedirects; }
    const std::string& getBody() const { return body; }
    const std::vector<std::pair<std::string, std::string>>& getHeaders() const { return headers; }

  private:
    HttpRequest(std::string urlText, std::string methodText, int timeout, bool redirects);

    std::string url;
    std::string method;
    int timeoutMs;
    bool followRedirects;
    bool chunked = false;
    boost::shared_ptr<NetworkTaskWriter> writer;
    std::string boundary;
    std::string body;
    std::string refusal;
    std::vector<std::pair<std::string, std::string>> headers;
};

}  // namespace Network
