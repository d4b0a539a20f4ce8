#include "Room.h"

#include <sched.h>
#include <signal.h>
#include <sys/mount.h>
#include <sys/resource.h>

#include <cstdint>

#include "support/ScratchDirectory.h"

namespace Torture {

namespace {

constexpr long PAGE_BYTES = 4096;
constexpr std::size_t HEADER_BYTES = 44;
constexpr std::size_t SIZE_PLACE = 40;

/** Of the shortest sound that a session whose dump is whole records. */
constexpr std::size_t WHOLE_BYTES = 32000;

std::size_t readSize(const std::string& file) {
    std::size_t size = 0;
    for (int i = 3; i >= 0; --i) {
        size = size << 8 | static_cast<unsigned char>(file[SIZE_PLACE + static_cast<unsigned>(i)]);
    }
    return size;
}

}  // namespace

Room::Room(const Order& order, Report& report) : directory(order.directory) {
    if (order.kind != static_cast<int>(Kind::SPACE)) {
        return;
    }
    const long bytes = order.call * PAGE_BYTES;
    if (order.onward != 0) {
        isMounted = mountSmall("size=" + std::to_string(bytes));
    }
    if (!isMounted) {
        limitFiles(bytes);
    }
    report.failedFunction = isMounted ? "small file system" : "limited file size";
}

Room::~Room() {
    if (isMounted) {
        umount2(directory, MNT_DETACH);
    }
    if (isLimited) {
        rlimit limit{};
        getrlimit(RLIMIT_FSIZE, &limit);
        limit.rlim_cur = limit.rlim_max;
        setrlimit(RLIMIT_FSIZE, &limit);
    }
}

bool Room::mountSmall(const std::string& options) {
    return unshare(CLONE_NEWNS) == 0 &&
           mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0 &&
           mount("none", directory, "tmpfs", 0, options.c_str()) == 0;
}

// The application's part: it does not want to die of a full file.
void Room::limitFiles(long bytes) {
    signal(SIGXFSZ, SIG_IGN);
    rlimit limit{};
    getrlimit(RLIMIT_FSIZE, &limit);
    limit.rlim_cur = static_cast<rlim_t>(bytes);
    isLimited = setrlimit(RLIMIT_FSIZE, &limit) == 0;
}

std::string findDumpFault(const std::string& path, bool isWhole) {
    const std::string file = TestSupport::ScratchDirectory::read(path);
    if (file.size() < HEADER_BYTES) {
        return isWhole ? "there is no dump" : "";
    }
    const std::size_t sound = file.size() - HEADER_BYTES;
    if (readSize(file) != sound) {
        return "the dump's header says " + std::to_string(readSize(file)) + " bytes of " +
               std::to_string(sound);
    }
    return isWhole && sound < WHOLE_BYTES ? "the dump is not whole" : "";
}

}  // namespace Torture
