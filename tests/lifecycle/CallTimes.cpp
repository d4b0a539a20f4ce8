#include "CallTimes.h"

#include <algorithm>

namespace Lifecycle {

float CallTimes::quantile(int ofThousand) const {
    if (durations.empty()) {
        return 0;
    }
    std::vector<float> sorted(durations);
    std::sort(sorted.begin(), sorted.end());
    return sorted[(sorted.size() - 1) * static_cast<std::size_t>(ofThousand) / 1000];
}

}  // namespace Lifecycle
