#include "Inject.h"

#include <execinfo.h>
#include <link.h>

#include <array>
#include <atomic>
#include <cstdint>
#include <cstring>

#include "Exclusions.h"
#include "Hook.h"

namespace Torture {

namespace {

std::atomic<bool> armed{false};
std::atomic<int> chosenKind{NO_KIND};
std::atomic<long> chosenCall{0};
std::atomic<bool> goesOn{false};
std::atomic<bool> keepsStack{false};
std::array<std::atomic<long>, KIND_COUNT> calls{};
std::atomic<bool> hasFailed{false};
Failure failure;
const char** failedNameTarget = nullptr;

// Part of the first block of each thread, so that its first use allocates nothing.
__attribute__((tls_model("initial-exec"))) thread_local int exemptLevel = 0;

/** Where the code of a library lies whose calls do not count. */
struct Range {
    std::uintptr_t begin = 0;
    std::uintptr_t end = 0;
    int kind = NO_KIND; /**< `NO_KIND`: of all kinds */
};

constexpr std::size_t RANGES_MAX = 32;
std::array<Range, RANGES_MAX> exemptRanges;
std::size_t exemptRangeCount = 0;

/** Code of the libraries that calls are restricted to. */
std::array<Range, RANGES_MAX> chosenRanges;
std::size_t chosenRangeCount = 0;
std::array<const char*, RANGES_MAX> chosenLibraries;
std::size_t chosenLibraryCount = 0;

void addCode(const dl_phdr_info& library, int kind, std::array<Range, RANGES_MAX>& ranges,
             std::size_t& count) {
    for (int i = 0; i < library.dlpi_phnum; ++i) {
        const ElfW(Phdr)& part = library.dlpi_phdr[i];
        const bool isCode = part.p_type == PT_LOAD && (part.p_flags & PF_X) != 0;
        if (isCode && count < RANGES_MAX) {
            const std::uintptr_t begin = library.dlpi_addr + part.p_vaddr;
            ranges[count++] = {begin, begin + part.p_memsz, kind};
        }
    }
}

int addLibrary(dl_phdr_info* library, std::size_t /*size*/, void* /*data*/) {
    for (const char* const sanitizer : {"/libasan.", "/libubsan."}) {
        if (std::strstr(library->dlpi_name, sanitizer) != nullptr) {
            addCode(*library, NO_KIND, exemptRanges, exemptRangeCount);
        }
    }
    for (const Exclusion& exclusion : EXCLUSIONS) {
        if (std::strstr(library->dlpi_name, exclusion.library) != nullptr) {
            addCode(*library, static_cast<int>(exclusion.kind), exemptRanges, exemptRangeCount);
        }
    }
    for (std::size_t i = 0; i < chosenLibraryCount; ++i) {
        if (std::strstr(library->dlpi_name, chosenLibraries[i]) != nullptr) {
            addCode(*library, NO_KIND, chosenRanges, chosenRangeCount);
        }
    }
    return 0;
}

bool isWithin(const std::array<Range, RANGES_MAX>& ranges, std::size_t count, Kind kind,
              const void* caller) {
    const auto place = reinterpret_cast<std::uintptr_t>(caller);
    for (std::size_t i = 0; i < count; ++i) {
        const Range& range = ranges[i];
        if (place >= range.begin && place < range.end &&
            (range.kind == NO_KIND || range.kind == static_cast<int>(kind))) {
            return true;
        }
    }
    return false;
}

bool isExempt(Kind kind, const void* caller) {
    return isWithin(exemptRanges, exemptRangeCount, kind, caller) ||
           (chosenLibraryCount > 0 && !isWithin(chosenRanges, chosenRangeCount, kind, caller));
}

void keepFailure(const char* name) {
    if (hasFailed.exchange(true)) {
        return;
    }
    *failedNameTarget = name;
    if (keepsStack) {
        const Exempt exempt;
        failure.depth = backtrace(failure.stack, STACK_MAX);
    }
}

}  // namespace

void* findInLoadedLibraries(const char* name) {
    const Exempt exempt;
    for (const char* const library : {"libssl.so.3", "libcrypto.so.3", "libpulse.so.0"}) {
        void* const handle = dlopen(library, RTLD_LAZY | RTLD_NOLOAD);
        void* const function = handle != nullptr ? dlsym(handle, name) : nullptr;
        if (function != nullptr) {
            return function;
        }
    }
    return nullptr;
}

bool counts() {
    return armed.load(std::memory_order_relaxed) && exemptLevel == 0;
}

bool fails(Kind kind, const char* name, const void* caller) {
    if (!counts() || isExempt(kind, caller)) {
        return false;
    }
    const int number = static_cast<int>(kind);
    const long call = ++calls[static_cast<std::size_t>(number)];
    if (number != chosenKind || call < chosenCall || (call > chosenCall && !goesOn)) {
        return false;
    }
    keepFailure(name);
    return true;
}

}  // namespace Torture

void tortureArm(int kind, long call, int onward, int withStack, const char** failedName) {
    using namespace Torture;
    if (withStack != 0) {
        const Exempt exempt;
        void* warmUp[1];
        backtrace(warmUp, 1);  // loads its library now
    }
    if (exemptRangeCount == 0 && chosenRangeCount == 0) {
        dl_iterate_phdr(&addLibrary, nullptr);
    }
    for (std::atomic<long>& count : calls) {
        count = 0;
    }
    failure = Failure();
    failedNameTarget = failedName;
    hasFailed = false;
    chosenKind = kind;
    chosenCall = call;
    goesOn = onward != 0;
    keepsStack = withStack != 0;
    armed = true;
}

void tortureRestrictTo(const char* library) {
    using namespace Torture;
    if (chosenLibraryCount < RANGES_MAX) {
        chosenLibraries[chosenLibraryCount++] = library;
    }
}

void tortureDisarm() {
    Torture::armed = false;
}

long tortureCountCalls(int kind) {
    return kind >= 0 && kind < Torture::KIND_COUNT
               ? Torture::calls[static_cast<std::size_t>(kind)].load()
               : 0;
}

const Torture::Failure* tortureFailure() {
    return &Torture::failure;
}

void tortureExempt(int change) {
    Torture::exemptLevel += change;
}
