#include "talvox/SpeechError.h"

#include "pal/kd_assert.h"
#include "talvox/impl/EarlyInit.h"

namespace Talvox {

TALVOX_EARLY const std::string SpeechError::errorStrings[SpeechError::ErrorMax] = {
    "ErrorUnknown",  "ErrorAudio",   "ErrorEncoding",     "ErrorNetwork", "ErrorServer",
    "ErrorCanceled", "ErrorNoVoice", "ErrorNotAvailable", "ErrorBusy"};

const std::string& SpeechError::getErrorString() const {
    if (!KOR_ASSERT_AT(code >= 0 && code < ErrorMax, "code >= 0 && code < ErrorMax",
                       "talvox/SpeechError", __LINE__)) {
        return errorStrings[ErrorUnknown];
    }
    return errorStrings[code];
}

}  // namespace Talvox
