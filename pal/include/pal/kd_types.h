/**
 * @file
 * Base types and the export macro of the platform layer.
 *
 * The platform layer is a C interface in the manner of OpenKODE: names begin with `kd`, and what
 * goes beyond OpenKODE carries the vendor suffix `KOR`. Every function may be called from any
 * thread unless its own text says otherwise, and none throws.
 */
#ifndef KORVEL_PAL_KD_TYPES_H
#define KORVEL_PAL_KD_TYPES_H

#include <stddef.h>
#include <stdint.h>

/** Marks what the library exports. */
#define KD_API __attribute__((visibility("default")))

#ifdef __cplusplus
/** Encloses declarations of C functions. */
#define KD_EXTERN_C_BEGIN extern "C" {
/** The end of `KD_EXTERN_C_BEGIN`. */
#define KD_EXTERN_C_END }
#else
#define KD_EXTERN_C_BEGIN
#define KD_EXTERN_C_END
#endif

/** Integers of a fixed size. */
typedef int32_t KDint;
typedef uint32_t KDuint;
typedef int64_t KDint64;
/** A size in bytes. */
typedef size_t KDsize;

/** Unadjusted system time: nanoseconds since an arbitrary fixed point; never goes backwards. */
typedef KDint64 KDust;

/** Calendar time: seconds since 1970-01-01 00:00:00 UTC. */
typedef KDint64 KDtime;

#endif
