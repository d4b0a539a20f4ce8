/**
 * @file
 * WAV file writer.
 */
#pragma once

#include <cstdint>
#include <string>

#include "core/io/OutputStream.h"
#include "core/sound/SoundDataInfo.h"
#include "pal/kd_file.h"
#include "talvox/Export.h"

namespace Util {

/**
 * Writes raw PCM into a WAV file: a header of 44 bytes, the samples as they come, and on closing
 * the two lengths in the header. Every failure is logged. Used by one thread at a time; blocks on
 * the file system only.
 *
 * A stream is closed by destroying it. Closing one by hand as well is harmless: the second closing
 * fails on the stale handle, with lines in the log.
 */
class TALVOX_API WavOutputStream : public IO::OutputStream {
  public:
    /** A stream without a file. */
    WavOutputStream();
    WavOutputStream(const WavOutputStream&) = delete;
    WavOutputStream& operator=(const WavOutputStream&) = delete;
    /** Closes. */
    ~WavOutputStream() override;

    /**
     * Creates the file (an existing one is replaced) and writes the header. A file of an earlier
     * call is closed first.
     * @param path  as for `kdFopen`
     * @param format  format of the samples; its codec is not looked at, the file is always PCM
     * @return false when the file could not be made; the stream has no file then
     */
    bool init(const std::string& path, const Sound::SoundDataInfo& format);

    /**
     * Appends sample bytes. The first failure is logged; what a disk has no room for is not in the
     * file, and the header does not count it.
     * @return the number of bytes written, or -1 without a file or with a negative size
     */
    int write(const void* data, int size) override;

    /** Writes the lengths into the header and closes the file. Lengths beyond 4 GB are cut to it.
     */
    void close();

  private:
    bool writeHeader();
    bool patchHeader();
    bool patchSize(int offset, std::uint32_t value);

    Sound::SoundDataInfo info;
    KDFile* file = nullptr;
    std::uint32_t dataBytes = 0;
    bool hasFailed = false;
};

}  // namespace Util
