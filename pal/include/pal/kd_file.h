/**
 * @file
 * Files over the C library, with virtual roots.
 *
 * A path whose beginning is a mounted virtual root is redirected to the mounted directory. The
 * root `/removable` is virtual from the start and not mounted: opening below it fails until the
 * embedder mounts it. All other paths are those of the operating system.
 *
 * A handle that is null, stale or closed already makes every call fail with its error value; no
 * freed memory is touched. Calls of several threads on one file are taken one after the other.
 */
#ifndef KORVEL_PAL_KD_FILE_H
#define KORVEL_PAL_KD_FILE_H

#include "pal/kd_types.h"

KD_EXTERN_C_BEGIN

/** An open file; made by `kdFopen`. */
typedef struct KDFile KDFile;

/** Where an offset of `kdFseek` begins; as C's `SEEK_SET`, `SEEK_CUR` and `SEEK_END`. */
typedef enum KDfileSeekOrigin {
    KD_SEEK_SET = 0,
    KD_SEEK_CUR = 1,
    KD_SEEK_END = 2
} KDfileSeekOrigin;

/**
 * Opens a file; `mode` as for C's `fopen`.
 * @return the file, owned by the caller until `kdFclose`; null on failure.
 */
KD_API KDFile* kdFopen(const char* pathname, const char* mode);

/** Closes the file. @return 0, or -1 on failure; the handle is stale afterwards in both cases. */
KD_API KDint kdFclose(KDFile* file);

/** Reads up to `count` items of `size` bytes. @return the number of whole items read. */
KD_API KDsize kdFread(void* buffer, KDsize size, KDsize count, KDFile* file);

/**
 * Writes `count` items of `size` bytes. Nothing is buffered: what a full disk refuses is missing in
 * the result of the call that wrote it.
 * @return the number of whole items written.
 */
KD_API KDsize kdFwrite(const void* buffer, KDsize size, KDsize count, KDFile* file);

/** Moves the position. @return 0, or -1 on failure. */
KD_API KDint kdFseek(KDFile* file, KDint64 offset, KDfileSeekOrigin origin);

/**
 * Makes `virtualRoot` (an absolute path such as "/removable", without a slash at its end) stand
 * for the directory `directory`. A null `directory` unmounts: opening below the root fails again.
 * @return 0, or -1 when `virtualRoot` is not an absolute path.
 */
KD_API KDint kdMountKOR(const char* virtualRoot, const char* directory);

KD_EXTERN_C_END

#endif
