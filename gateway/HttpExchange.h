#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "gateway/Arrivals.h"
#include "gateway/BodyPump.h"
#include "gateway/RecognitionRequest.h"
#include "gateway/Server.h"

struct MHD_Connection;

namespace Gateway {

/** One request on one connection, in the order in which the HTTP library reports it. */
class HttpExchange {
  public:
    HttpExchange(Server& exchangeServer, MHD_Connection* httpConnection, const char* path,
                 const char* method);

    /** The head has been read: refuses the request, or waits for its body. @return false to hang up
     */
    bool onHead();

    /** More of the body. @return false to hang up */
    bool onBody(const char* data, std::size_t size);

    /** The body is complete: answers. @return false to hang up */
    bool onEnd();

    /** The exchange is over, answered or not. */
    void onCompleted();

  private:
    Answer judgeHead();
    Answer judgeRecognition();
    Answer judgeRecognitionHead();
    void beginBody(const std::string& boundary);
    void writeBody(const std::string& piece);
    Answer recognise();
    Answer sayReady() const;
    Answer answerPage() const;
    Answer answerAtEnd() const;
    Answer judgeRecord(const std::optional<std::string>& uuid,
                       const std::optional<std::string>& record) const;
    Answer keepRecord() const;
    bool send(const Answer& answer);
    void logRefusal(const Answer& answer) const;
    void log(unsigned status, const std::string& what) const;
    std::string readHeader(const char* name) const;
    std::optional<std::string> readRawArgument(const char* name) const;
    std::string readArgument(const char* name) const;

    Server& server;
    MHD_Connection* const connection;
    RequestHead head;
    /** What the page shows; null without it. */
    SessionList* const sessions;
    SessionList::Id session = 0;
    Arrivals arrivals;
    std::size_t bodyBytes = 0;
    std::unique_ptr<RecognitionRequest> request;
    /** Feeds the request; null before the body, and once the request is over. */
    std::unique_ptr<BodyPump> pump;
    /** An answer before the end of a request would cost the connection. */
    bool isAnsweredAtEnd = false;
    bool answered = false;
};

}  // namespace Gateway
