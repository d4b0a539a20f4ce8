#include "MemoryCurve.h"

#include <malloc.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <fstream>

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
// GCC does not install the header of it. NOLINTNEXTLINE(bugprone-reserved-identifier)
extern "C" std::size_t __sanitizer_get_current_allocated_bytes();
#endif

namespace Soak {

std::size_t countLiveBytes() {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    return __sanitizer_get_current_allocated_bytes();
#else
    const struct mallinfo2 now = mallinfo2();
    return now.uordblks + now.hblkhd;
#endif
}

bool isSanitized() {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    return true;
#else
    return false;
#endif
}

bool isExact() {
    const char* const tunables = std::getenv("GLIBC_TUNABLES");
    return isSanitized() ||
           (tunables != nullptr && std::strstr(tunables, "malloc.tcache_count=0") != nullptr);
}

std::size_t countResidentBytes() {
    std::size_t total = 0;
    std::size_t resident = 0;
    std::ifstream("/proc/self/statm") >> total >> resident;
    return resident * static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
}

// The median of the slopes between all pairs of points: a single odd measurement does not count.
double MemoryCurve::getBytesPerSession(std::size_t first) const {
    std::vector<double> slopes;
    for (std::size_t left = first; left < points.size(); ++left) {
        for (std::size_t right = left + 1; right < points.size(); ++right) {
            slopes.push_back((points[right] - points[left]) /
                             (static_cast<double>(right - left) * sessions));
        }
    }
    const auto middle = slopes.begin() + static_cast<std::ptrdiff_t>(slopes.size() / 2);
    std::nth_element(slopes.begin(), middle, slopes.end());
    return slopes.empty() ? 0 : *middle;
}

MemoryCurve MemoryCurve::withLeak(double bytesPerSession) const {
    MemoryCurve leaking(*this);
    for (std::size_t i = 0; i < leaking.points.size(); ++i) {
        leaking.points[i] += bytesPerSession * sessions * static_cast<double>(i);
    }
    return leaking;
}

}  // namespace Soak
