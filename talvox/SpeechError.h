/**
 * @file
 * Why a recognition ended without results.
 */
#pragma once

#include <string>

#include "talvox/Export.h"

namespace Talvox {

/**
 * An error code; a plain value. `Recognizer::getErrorReason` says more. "Device recognizer" is the
 * platform's own, which reports errors of its own choice.
 */
class TALVOX_API SpeechError {
  public:
    /** The numbers are fixed. */
    enum Code {
        /**
         * The engine got no thread, memory ran out, or a listener threw. The device recognizer: it
         * failed without a cause that has a code here.
         */
        ErrorUnknown = 0,
        /**
         * The recorder could not be started, failed, or delivered too little; or the session was
         * stopped before any sound. The device recognizer: no microphone, or no permission.
         */
        ErrorAudio = 1,
        /** There was no memory or thread for the Speex encoder. */
        ErrorEncoding = 2,
        /**
         * Everything between the engine and results: no network at the start, no address or
         * identifier in the engine's settings, a request that cannot be sent, no connection, no
         * answer within 20 s, and every answer without readable results, whatever its HTTP status.
         * The device recognizer: network errors, and no callback of it within its time limits.
         */
        ErrorNetwork = 3,
        /** The device recognizer's service failed. The cloud service's failures are `ErrorNetwork`.
         */
        ErrorServer = 4,
        /** The application cancelled. */
        ErrorCanceled = 5,
        /** No speech within 5 s of the start. The device recognizer: its own limit. */
        ErrorNoVoice = 6,
        /**
         * The settings and the platform leave no recognition mechanism. The device recognizer: it
         * could not be started, or it does not have the language.
         */
        ErrorNotAvailable = 7,
        /**
         * Another session is active, or this one was started a second time. The device recognizer:
         * it is in use elsewhere.
         */
        ErrorBusy = 8,
        /** Number of codes; not a code. */
        ErrorMax = 9
    };

    /** The texts, indexed by code. */
    static const std::string errorStrings[ErrorMax];

    /** Not explicit: a code is an error. */
    SpeechError(int errorCode) : code(errorCode) {}

    /** As given to the constructor; any number. */
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
