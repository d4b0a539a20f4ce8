#include "util/WavOutputStream.h"

#include "pal/kd_assert.h"
#include "pal/kd_log.h"
#include "util/impl/WavHeader.h"

namespace Util {

namespace {

void logFileNotOpened(const char* operation) {
    kdLogFormatMessage("%s: file not opened", operation);
}

/** Writes one item at an offset; failures are logged. */
bool writeAt(const char* operation, KDFile* file, int offset, const void* bytes, KDsize size) {
    if (kdFseek(file, offset, KD_SEEK_SET) < 0) {
        kdLogFormatMessage("%s: error in fseek", operation);
        return false;
    }
    if (kdFwrite(bytes, size, 1, file) != 1) {
        kdLogFormatMessage("%s: error in write", operation);
        return false;
    }
    return true;
}

}  // namespace

WavOutputStream::WavOutputStream() = default;

WavOutputStream::~WavOutputStream() {
    close();
}

bool WavOutputStream::init(const std::string& path, const Sound::SoundDataInfo& format) {
    if (file != nullptr) {
        close();
    }
    info = format;
    file = kdFopen(path.c_str(), "wb");
    if (file == nullptr) {
        kdLogFormatMessage("%s: could not open file %s", "init", path.c_str());
        return false;
    }
    if (!writeHeader()) {
        kdFclose(file);
        file = nullptr;
        return false;
    }
    dataBytes = 0;
    hasFailed = false;
    return true;
}

int WavOutputStream::write(const void* data, int size) {
    if (file == nullptr) {
        logFileNotOpened("write");
        return -1;
    }
    if (!KOR_ASSERT(size >= 0)) {
        return -1;
    }
    const auto written = static_cast<int>(kdFwrite(data, 1, static_cast<KDsize>(size), file));
    if (written >= 1) {
        dataBytes = WavHeader::grow(dataBytes, written);
    }
    if (written < size && !hasFailed) {
        hasFailed = true;
        kdLogFormatMessage("%s: error in write", "write");
    }
    return written;
}

void WavOutputStream::close() {
    if (file == nullptr) {
        logFileNotOpened("close");
        return;
    }
    const bool isPatched = patchHeader();
    if (kdFclose(file) != 0 && isPatched) {
        kdLogFormatMessage("%s: error in close", "close");
    }
    kdLogFormatMessage("%s: after kdFclose", "close");
}

bool WavOutputStream::writeHeader() {
    if (file == nullptr) {
        logFileNotOpened("writeHeader");
        return false;
    }
    const WavHeader::Bytes header = WavHeader::build(info);
    return writeAt("writeHeader", file, 0, header.data(), header.size());
}

bool WavOutputStream::patchHeader() {
    if (file == nullptr) {
        logFileNotOpened("patchHeader");
        return false;
    }
    return patchSize(WavHeader::CHUNK_SIZE_OFFSET, WavHeader::chunkSize(dataBytes)) &&
           patchSize(WavHeader::DATA_SIZE_OFFSET, dataBytes);
}

bool WavOutputStream::patchSize(int offset, std::uint32_t value) {
    const WavHeader::Number bytes = WavHeader::littleEndian(value);
    return writeAt("patchHeader", file, offset, bytes.data(), bytes.size());
}

}  // namespace Util
