/**
 * @file
 * Calls that never fail here, because the library that makes them ends the process when they do, or
 * is of no use afterwards.
 */
#pragma once

#include "Inject.h"

namespace Torture {

/** Calls of one kind that are made from a library of others. */
struct Exclusion {
    Kind kind;
    const char* library; /**< a part of its file's name */
    const char* reason;  /**< for the document */
};

constexpr Exclusion EXCLUSIONS[] = {
    {Kind::MEMORY, "libpulse",
     "its allocator (`pa_xmalloc`) ends the process when there is no memory, as documented"},
    {Kind::MEMORY, "libspeex",
     "follows a null pointer when there is no memory for the narrow-band half of a wide-band codec "
     "(`sb_encoder_init`, `sb_decoder_init`)"},
    {Kind::MEMORY, "libcrypto",
     "an algorithm that it has no memory for at its first use is missing until the process ends"},
    {Kind::CLOCK, "libpulse", "asserts that the clock can be read (`pa_rtclock_get`)"},
    {Kind::FILES, "libpulse",
     "asserts that `close` succeeds (`pa_cmsg_ancil_data_close_fds`, pstream.c)"},
};

}  // namespace Torture
