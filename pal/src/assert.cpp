#include <cstdlib>
#include <mutex>
#include <string>

#include "pal/kd_assert.h"
#include "pal/kd_log.h"

namespace {

struct AssertionHandler {
    KDAssertionHandlerFuncKOR* func;
    void* user;
};

void logAndAbort(const char* condition, const char* filename, KDint linenumber, void* /*user*/) {
    kdLogFormatMessage("assertion failed: %s (%s:%d)", condition, filename, linenumber);
    std::abort();
}

// Never destroyed: threads may outlive the static objects of the process.
std::mutex& handlerMutex() {
    static std::mutex* const mutex = new std::mutex;
    return *mutex;
}

AssertionHandler& installedHandler() {
    static AssertionHandler handler{&logAndAbort, nullptr};
    return handler;
}

AssertionHandler currentHandler() {
    const std::lock_guard<std::mutex> lock(handlerMutex());
    return installedHandler();
}

}  // namespace

void kdHandleAssertion(const char* condition, const char* filename, KDint linenumber) {
    const AssertionHandler handler = currentHandler();
    handler.func(condition != nullptr ? condition : "", filename != nullptr ? filename : "",
                 linenumber, handler.user);
}

void kdSetAssertionHandlerKOR(KDAssertionHandlerFuncKOR* handler, void* user) {
    const std::lock_guard<std::mutex> lock(handlerMutex());
    installedHandler() = {handler != nullptr ? handler : &logAndAbort, user};
}

void kdHandleAssertionInFileKOR(const char* condition, const char* file, KDint linenumber) {
    std::string path(file != nullptr ? file : "");
    const std::string::size_type dot = path.rfind('.');
    const std::string::size_type slash = path.rfind('/');
    if (dot != std::string::npos && (slash == std::string::npos || dot > slash)) {
        path.resize(dot);
    }
    kdHandleAssertion(condition, path.c_str(), linenumber);
}
