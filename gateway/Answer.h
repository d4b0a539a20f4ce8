#pragma once

#include <string>
#include <utility>
#include <vector>

namespace Gateway {

/** An HTTP answer, ready to be sent. */
struct Answer {
    unsigned status = 200;
    std::vector<std::pair<std::string, std::string>> headers;
    /** The reason where the request was refused. */
    std::string body;
    std::string contentType = "text/plain; charset=utf-8";

    /** A refusal; clients get `reason` as the body. */
    static Answer refuse(unsigned status, const std::string& reason) {
        Answer answer;
        answer.status = status;
        answer.body = reason + "\n";
        return answer;
    }
};

}  // namespace Gateway
