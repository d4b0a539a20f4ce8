#include <algorithm>
#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <string>

#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace {

struct AssertionHandler {
    KDAssertionHandlerFuncKOR* func;
    void* user;
};

/** 64-bit FNV-1a; equal values count as the same site. */
std::uint64_t hashOf(const char* condition, const char* filename, KDint linenumber) {
    const std::string site =
        std::string(filename) + ':' + std::to_string(linenumber) + ':' + condition;
    std::uint64_t hash = 0xCBF29CE484222325U;
    for (const char c : site) {
        hash = (hash ^ static_cast<unsigned char>(c)) * 0x100000001B3U;
    }
    return hash;
}

/** Counts reports by site, in bounded memory. */
class SiteCounts {
  public:
    /** @return which report of its site this one is, from 1 */
    std::uint64_t add(std::uint64_t site) {
        const std::lock_guard<std::mutex> lock(mutex);
        const auto end = entries.begin() + static_cast<std::ptrdiff_t>(used);
        auto entry =
            std::find_if(entries.begin(), end, [site](const Entry& e) { return e.site == site; });
        if (entry == end && used < entries.size()) {
            entry->site = site;
            ++used;
        }
        return entry == entries.end() ? ++others : ++entry->count;
    }

  private:
    struct Entry {
        std::uint64_t site;
        std::uint64_t count;
    };

    std::mutex mutex;
    std::array<Entry, 256> entries = {};
    std::size_t used = 0;
    std::uint64_t others = 0;
};

bool isPowerOfTen(std::uint64_t number) {
    while (number >= 10 && number % 10 == 0) {
        number /= 10;
    }
    return number == 1;
}

void logSparsely(const char* condition, const char* filename, KDint linenumber, void* /*user*/) {
    // Never destroyed: threads may outlive the static objects of the process.
    static SiteCounts* const sites = new SiteCounts;
    const std::uint64_t count = sites->add(hashOf(condition, filename, linenumber));
    if (!isPowerOfTen(count)) {
        return;
    }
    const std::string repeats = count == 1 ? "" : ", " + std::to_string(count) + " times";
    kdLogFormatMessage("assertion failed: %s (%s:%d)%s", condition, filename, linenumber,
                       repeats.c_str());
}

// Never destroyed, for the same reason.
std::mutex& handlerMutex() {
    static std::mutex* const mutex = new std::mutex;
    return *mutex;
}

AssertionHandler& installedHandler() {
    static AssertionHandler handler{&logSparsely, nullptr};
    return handler;
}

AssertionHandler currentHandler() {
    const std::lock_guard<std::mutex> lock(handlerMutex());
    return installedHandler();
}

std::atomic<KDint64> reportCount{0};

}  // namespace

void kdHandleAssertion(const char* condition, const char* filename, KDint linenumber) {
    ++reportCount;
    const AssertionHandler handler = currentHandler();
    handler.func(condition != nullptr ? condition : "", filename != nullptr ? filename : "",
                 linenumber, handler.user);
}

void kdSetAssertionHandlerKOR(KDAssertionHandlerFuncKOR* handler, void* user) {
    const std::lock_guard<std::mutex> lock(handlerMutex());
    installedHandler() = {handler != nullptr ? handler : &logSparsely, user};
}

KDint64 kdGetAssertionCountKOR(void) {
    return reportCount;
}

void kdHandleAssertionInFileKOR(const char* condition, const char* file, KDint linenumber) {
    std::string path(file != nullptr ? file : "");
    // Where a compiler cache makes paths relative to the folder of the build.
    while (path.compare(0, 3, "../") == 0) {
        path.erase(0, 3);
    }
    const std::string::size_type dot = path.rfind('.');
    const std::string::size_type slash = path.rfind('/');
    if (dot != std::string::npos && (slash == std::string::npos || dot > slash)) {
        path.resize(dot);
    }
    kdHandleAssertion(condition, path.c_str(), linenumber);
}
