/**
 * @file
 * The recognizer for which there is always memory.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <boost/weak_ptr.hpp>

#include "talvox/Recognizer.h"

namespace Talvox {

/**
 * Made in good time, and handed out where there is no memory for a recognizer. Each time its one
 * session ends with `ErrorUnknown`, or with `ErrorCanceled` when it is cancelled before. Neither
 * handing it out nor its end takes memory.
 */
class ReserveRecognizer : public Recognizer {
  public:
    ReserveRecognizer(const Talvox* facade, boost::shared_ptr<const Settings> settings);
    ~ReserveRecognizer() override;

    /** A new session begins, with this listener. Nobody but the facade may own the object. */
    void assign(const boost::weak_ptr<RecognizerListener>& listener) noexcept;

    void start() override;
    void stop() override;
    void cancel() override;

  private:
    void end(SpeechError error, std::string_view reason);

    /** Not in the list of the base, which takes memory. */
    boost::weak_ptr<RecognizerListener> firstListener;
    bool over = false;
};

}  // namespace Talvox
