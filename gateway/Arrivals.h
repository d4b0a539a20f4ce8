#pragma once

#include <cstddef>
#include <string>

#include "pal/kd_time.h"

namespace Gateway {

/**
 * When the pieces of a request's body arrived, and how long its answer took. A piece is a chunk of
 * the body, or the part of it that one read from the connection returned. All times are those of
 * the platform clock and never decrease.
 */
class Arrivals {
  public:
    /** @param head when the head of the request had arrived */
    explicit Arrivals(KDust head) : headAt(head), lastAt(head) {}

    /** A piece has arrived. */
    void add(KDust at);

    /** The answer is ready. Its time counts from the last piece, or from the head without any. */
    void answer(KDust at);

    /** Time from the head to another moment, in nanoseconds. */
    KDust sinceHead(KDust at) const { return at - headAt; }

    /** Time that the answer took, in nanoseconds; 0 before it. */
    KDust getAnswerTime() const { return isAnswered ? answerAt - lastAt : 0; }

    /**
     * Such as "pieces=35 first=1ms last=3402ms gap=104ms answer=143ms": the number of pieces, the
     * first and the last of them as times since the head, the longest time between two, and the
     * time from the last piece to the answer. What has not happened is left out.
     */
    std::string describe() const;

  private:
    KDust headAt;
    KDust firstAt = 0;
    KDust lastAt;
    KDust longestGap = 0;
    KDust answerAt = 0;
    std::size_t pieces = 0;
    bool isAnswered = false;
};

}  // namespace Gateway
