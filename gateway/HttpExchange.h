#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>

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
    std::unique_ptr<RecognitionRequest> request;
    bool carriesRecord = false;
    bool answered = false;
};

}  // namespace Gateway
