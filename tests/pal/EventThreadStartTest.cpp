// An event thread that cannot start: the report, and that the next post tries again. Each case has
// a process of its own, since the thread starts once.
#include <dlfcn.h>
#include <gmock/gmock.h>
#include <sys/resource.h>
#include <uv.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "pal/kd_event.h"
#include "support/AssertCapture.h"

namespace {

/** libuv makes one of these for itself; the next is ours. Below 0 none fails. */
int asyncsUntilFailure = -1;

}  // namespace

// Stands in front of libuv's.
extern "C" __attribute__((visibility("default"))) int uv_async_init(uv_loop_t* loop,
                                                                    uv_async_t* handle,
                                                                    uv_async_cb callback) {
    using Init = int (*)(uv_loop_t*, uv_async_t*, uv_async_cb);
    static const auto real = reinterpret_cast<Init>(::dlsym(RTLD_NEXT, "uv_async_init"));
    return asyncsUntilFailure >= 0 && asyncsUntilFailure-- == 0 ? UV_ENOMEM
                                                                : real(loop, handle, callback);
}

namespace {

using ::testing::ExitedWithCode;
using TestSupport::AssertCapture;

/** Posts once with `failing` in force and once without; tells what was reported and what ran. */
template <typename Begin, typename End>
[[noreturn]] void postTwice(Begin beginFailing, End endFailing) {
    const AssertCapture asserts;
    int runs = 0;
    const auto post = [&runs] {
        kdPostKOR([](void* count) { ++*static_cast<int*>(count); }, &runs);
    };
    beginFailing();
    post();
    endFailing();
    const std::size_t reports = asserts.count();
    post();
    kdDrainEventsKOR();
    const std::string first = reports > 0 ? asserts.reports()[0].condition : "nothing";
    std::fprintf(stderr, "%zu: %s, then %zu; %d ran", reports, first.c_str(), asserts.count(),
                 runs);
    std::_Exit(0);
}

void allowDescriptors(rlim_t count) {
    rlimit limit = {};
    ::getrlimit(RLIMIT_NOFILE, &limit);
    limit.rlim_cur = count;
    ::setrlimit(RLIMIT_NOFILE, &limit);
}

TEST(EventThreadStartDeathTest, WithoutDescriptorsIsReportedAndTriedAgain) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(postTwice([] { allowDescriptors(0); }, [] { allowDescriptors(64); }),
                ExitedWithCode(0), "^1: uv_loop_init\\(&loop\\) == 0, then 1; 1 ran$");
}

TEST(EventThreadStartDeathTest, WithoutASignalIsReportedAndTriedAgain) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(postTwice([] { asyncsUntilFailure = 1; }, [] { asyncsUntilFailure = -1; }),
                ExitedWithCode(0),
                "^1: uv_async_init\\(&loop, &async, &EventLoop::onWake\\) == 0, then 1; 1 ran$");
}

}  // namespace
