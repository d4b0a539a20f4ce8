#include "DetectorCalls.h"

#include <dlfcn.h>

namespace CloudTest {

namespace {

std::vector<std::string>& getList() {
    static std::vector<std::string> calls;
    return calls;
}

}  // namespace

std::vector<std::string> takeDetectorCalls() {
    std::vector<std::string> calls;
    calls.swap(getList());
    return calls;
}

}  // namespace CloudTest

using CloudTest::getList;

int WebRtcVad_force_noise(VadInst* handle, int flag) {
    static const auto real = reinterpret_cast<decltype(&WebRtcVad_force_noise)>(
        dlsym(RTLD_NEXT, "WebRtcVad_force_noise"));
    if (flag != 0) {
        getList().emplace_back("force noise");
    }
    return real(handle, flag);
}

int WebRtcVad_set_mode_fine_grained(VadInst* handle, const WebRtc_ModeParams* params) {
    static const auto real = reinterpret_cast<decltype(&WebRtcVad_set_mode_fine_grained)>(
        dlsym(RTLD_NEXT, "WebRtcVad_set_mode_fine_grained"));
    getList().emplace_back("individual " + std::to_string(params->individual));
    return real(handle, params);
}
