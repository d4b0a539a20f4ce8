/**
 * @file
 * Why a recognition ended without results.
 */
#pragma once

#include <string>

#include "talvox/Export.h"

namespace Talvox {

/** An error code; a plain value. */
class TALVOX_API SpeechError {
  public:
    /** The numbers are fixed. */
    enum Code {
        ErrorUnknown = 0,
        ErrorAudio = 1,        /**< no sound could be recorded */
        ErrorEncoding = 2,     /**< the sound could not be encoded */
        ErrorNetwork = 3,      /**< the service was not reached, or the settings do not name it */
        ErrorServer = 4,       /**< the service answered with a failure or not understandably */
        ErrorCanceled = 5,     /**< the application cancelled */
        ErrorNoVoice = 6,      /**< nobody spoke */
        ErrorNotAvailable = 7, /**< no recognition mechanism is available */
        ErrorBusy = 8,         /**< another recognition is active */
        ErrorMax = 9           /**< number of codes; not a code */
    };

    /** The texts, indexed by code. */
    static const std::string errorStrings[ErrorMax];

    /** Not explicit: a code is an error. */
    SpeechError(int errorCode) : code(errorCode) {}

    int getCode() const { return code; }

    /**
     * The code's name, such as "ErrorAudio". A code outside 0 to 8 is reported to the assertion
     * handler; should that return, the text is that of `ErrorUnknown`.
     */
    const std::string& getErrorString() const;

  private:
    int code;
};

}  // namespace Talvox
