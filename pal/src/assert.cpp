#include <algorithm>
#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <mutex>
#include <string_view>

#include "immortal.h"
#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace {

using korvel_pal::Immortal;

constexpr std::size_t PATH_BYTES_MAX = 1024;

struct AssertionHandler {
    KDAssertionHandlerFuncKOR* func;
    void* user;
};

/** 64-bit FNV-1a. Takes no memory, as all of a report: it may be about the want of it. */
class SiteHash {
  public:
    SiteHash& add(const char* text) {
        for (; *text != '\0'; ++text) {
            addByte(static_cast<unsigned char>(*text));
        }
        addByte(0);
        return *this;
    }

    SiteHash& add(KDint number) {
        for (auto left = static_cast<std::uint32_t>(number); left != 0; left >>= 8) {
            addByte(left & 0xFFU);
        }
        return *this;
    }

    std::uint64_t get() const { return hash; }

  private:
    void addByte(std::uint32_t byte) { hash = (hash ^ byte) * 0x100000001B3U; }

    std::uint64_t hash = 0xCBF29CE484222325U;
};

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
    static Immortal<SiteCounts> sites;
    // Equal values count as the same site.
    const std::uint64_t site = SiteHash().add(condition).add(filename).add(linenumber).get();
    const std::uint64_t count = sites.get().add(site);
    if (count == 1) {
        kdLogFormatMessage("assertion failed: %s (%s:%d)", condition, filename, linenumber);
    } else if (isPowerOfTen(count)) {
        kdLogFormatMessage("assertion failed: %s (%s:%d), %llu times", condition, filename,
                           linenumber, static_cast<unsigned long long>(count));
    }
}

std::mutex& handlerMutex() {
    static Immortal<std::mutex> mutex;
    return mutex.get();
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
    std::string_view path(file != nullptr ? file : "");
    // Where a compiler cache makes paths relative to the folder of the build.
    while (path.substr(0, 3) == "../") {
        path.remove_prefix(3);
    }
    const std::string_view::size_type dot = path.rfind('.');
    const std::string_view::size_type slash = path.rfind('/');
    if (dot != std::string_view::npos && (slash == std::string_view::npos || dot > slash)) {
        path = path.substr(0, dot);
    }
    std::array<char, PATH_BYTES_MAX> text = {};
    path.copy(text.data(), text.size() - 1);
    kdHandleAssertion(condition, text.data(), linenumber);
}
