#pragma once

#include <exception>

#include "pal/kd_log.h"

namespace Network {

/** Makes a call for libcurl, which is C: for what it throws, `failed` is returned. */
template <typename Result, typename Call>
Result guardForCurl(Result failed, Call call) noexcept {
    try {
        return call();
    } catch (const std::exception& exception) {
        kdLogFormatMessage("Network: a transfer cannot go on: %s", exception.what());
    } catch (...) {
        kdLogMessage("Network: a transfer cannot go on: an exception of an unknown type");
    }
    return failed;
}

}  // namespace Network
