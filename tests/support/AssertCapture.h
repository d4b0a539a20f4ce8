/**
 * @file
 * Catches reported assertions for the length of a scope.
 */
#pragma once

#include <cstddef>
#include <mutex>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

#include "pal/kd_assert.h"
#include "support/AbortOnAssertion.h"

namespace TestSupport {

/** One reported assertion. */
struct AssertReport {
    std::string condition;
    std::string path;
    int line = 0;

    bool operator==(const AssertReport& other) const {
        return condition == other.condition && path == other.path && line == other.line;
    }
};

inline void PrintTo(const AssertReport& report, std::ostream* out) {
    *out << report.condition << " (" << report.path << ":" << report.line << ")";
}

/** What a throwing capture throws; its text is the condition. */
class AssertionRaised : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

/**
 * Takes every assertion, from any thread, while it lives; the next one then ends the process again.
 * One at a time.
 */
class AssertCapture {
  public:
    enum Then { RETURN, THROW };

    /** @param then  return to the failed code, which goes on, or throw `AssertionRaised` from it */
    explicit AssertCapture(Then then = RETURN) : action(then) {
        kdSetAssertionHandlerKOR(&AssertCapture::receive, this);
    }
    ~AssertCapture() { abortOnAssertion(); }
    AssertCapture(const AssertCapture&) = delete;
    AssertCapture& operator=(const AssertCapture&) = delete;

    /** All reports so far, oldest first. */
    std::vector<AssertReport> reports() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return entries;
    }

    std::size_t count() const { return reports().size(); }

    void clear() {
        const std::lock_guard<std::mutex> lock(mutex);
        entries.clear();
    }

  private:
    static void receive(const char* condition, const char* path, KDint line, void* user) {
        auto* self = static_cast<AssertCapture*>(user);
        {
            const std::lock_guard<std::mutex> lock(self->mutex);
            self->entries.push_back({condition, path, line});
        }
        if (self->action == THROW) {
            throw AssertionRaised(condition);
        }
    }

    const Then action;
    mutable std::mutex mutex;
    std::vector<AssertReport> entries;
};

/** The handler of an application that installs none, while this lives. */
class DefaultAssertionHandler {
  public:
    DefaultAssertionHandler() { kdSetAssertionHandlerKOR(nullptr, nullptr); }
    ~DefaultAssertionHandler() { abortOnAssertion(); }
    DefaultAssertionHandler(const DefaultAssertionHandler&) = delete;
    DefaultAssertionHandler& operator=(const DefaultAssertionHandler&) = delete;
};

}  // namespace TestSupport
