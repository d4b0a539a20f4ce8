/**
 * @file
 * What the gateway of the torture understands.
 */
#pragma once

namespace Torture {

constexpr const char* WORDS = "go forward";

/** In the requests of the session in which a call fails, and of the one that follows. */
constexpr const char* FIRST_UUID = "0123456789abcdef0123456789abcdef";
constexpr const char* NEXT_UUID = "fedcba9876543210fedcba9876543210";

}  // namespace Torture
