// What the whole process has used so far.
#pragma once

#include <unistd.h>

#include <ctime>
#include <fstream>

namespace Bench {

/** Resident memory of the process in KiB. */
inline long residentKiB() {
    std::ifstream file("/proc/self/statm");
    long total = 0;
    long resident = 0;
    file >> total >> resident;
    return resident * sysconf(_SC_PAGESIZE) / 1024;
}

/** Processor time that the whole process has used, in milliseconds. */
inline double processCpuMs() {
    timespec time{};
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &time);
    return static_cast<double>(time.tv_sec) * 1e3 + static_cast<double>(time.tv_nsec) / 1e6;
}

}  // namespace Bench
