/**
 * @file
 * What the runner orders from a victim, and what the victim reports. Plain memory: both go through
 * pipes, and the report is written in memory that survives the process.
 */
#pragma once

#include <cstddef>
#include <cstdint>

#include "inject/Inject.h"

namespace Torture {

constexpr std::size_t TEXT_MAX = 256;
constexpr std::size_t LOG_MAX = 8192;

/** What a process holds when its sessions are over. */
struct Holdings {
    std::size_t threads = 0;
    std::size_t connections = 0; /**< kept for further requests */
    std::size_t descriptors = 0; /**< all others */
};

/** One point: a canonical session in which one call fails, or all from one call on. */
struct Order {
    int session = 0;
    int kind = NO_KIND;
    long call = 0;
    int onward = 0;
    int withStack = 0;
    Holdings holdings;       /**< what a sound run leaves; nothing when that is to be found out */
    char url[TEXT_MAX] = {}; /**< the gateway of the session */
    char nextUrl[TEXT_MAX] = {};   /**< the gateway of the session that follows */
    char logUrl[TEXT_MAX] = {};    /**< takes the usage records */
    char directory[TEXT_MAX] = {}; /**< for dumps; exists */
    char certificates[TEXT_MAX] = {};
};

/** How far a victim came. */
enum class Stage : int { PREPARES, SESSION, NEXT_SESSION, SETTLES, EXITS };

/** One session as its listener saw it. */
struct SessionOutcome {
    int created = 0; /**< `createRecognizer` returned a recognizer */
    int ends = 0;    /**< terminal events */
    int error = -1;  /**< the code of the last error; -1 when there was none */
    int results = 0; /**< there were results, with the gateway's words */
    int wrongText = 0;
    int logged = 0;                /**< lines in the log */
    std::int64_t endMs = -1;       /**< from `start` to the end on the platform clock */
    char exception[TEXT_MAX] = {}; /**< an exception that left the API, and which call */
};

struct Report {
    Stage stage = Stage::PREPARES;
    SessionOutcome first;
    SessionOutcome next;
    long calls[KIND_COUNT] = {};
    const char* failedFunction = nullptr; /**< its name; has a meaning in victims only */
    char failed[TEXT_MAX] = {};           /**< the same; empty when no call failed */
    Holdings holdings;
    std::size_t pendingRecords = 0;
    char dumpFault[TEXT_MAX] = {}; /**< what is wrong with the dumped sound */
    std::int64_t exitBeganNs = 0;
    std::size_t logSize = 0;
    char log[LOG_MAX] = {};
};

/** What the process that looks after victims adds; followed by `outputSize` bytes of output. */
struct Verdict {
    Report report;
    int status = 0;           /**< of `waitpid` */
    int timedOut = 0;         /**< it was killed when its time was over */
    std::int64_t exitMs = -1; /**< from the last statement of `main` to the end of the process */
    std::size_t outputSize = 0;
};

}  // namespace Torture
