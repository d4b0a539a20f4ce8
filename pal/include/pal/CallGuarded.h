/**
 * @file
 * Calls whose exceptions go no further.
 */
#pragma once

#include <exception>

#include "pal/kd_event.h"

namespace korvel_pal {

/** Makes a call whose exception is reported by `kdReportExceptionKOR` and goes no further. */
template <typename Call>
void callGuarded(Call call) noexcept {
    try {
        call();
    } catch (const std::exception& exception) {
        kdReportExceptionKOR(exception.what());
    } catch (...) {
        kdReportExceptionKOR(nullptr);
    }
}

}  // namespace korvel_pal
