#include "Plan.h"

#include <array>

namespace Torture {

namespace {

const std::array<const char*, KIND_COUNT> KIND_NAMES = {
    "memory", "threads", "descriptors", "sockets", "files",
    "clock",  "names",   "pulse",       "tls",     "space"};

Plan make(const char* name, const char* title, void (*change)(Plan&)) {
    Plan plan{name, title};
    change(plan);
    return plan;
}

std::vector<Plan> makePlans() {
    return {
        make("simple", "PCM in one request", [](Plan&) {}),
        make("chunked", "PCM, streamed", [](Plan& plan) { plan.chunked = true; }),
        make("simple-speex", "Speex in one request", [](Plan& plan) { plan.speex = true; }),
        make("chunked-speex", "Speex, streamed",
             [](Plan& plan) { plan.chunked = plan.speex = true; }),
        make("second", "Speex, streamed, after another session",
             [](Plan& plan) { plan.chunked = plan.speex = plan.warm = true; }),
        make("stop", "`stop` while the user speaks",
             [](Plan& plan) { plan.ending = Plan::Ending::STOP; }),
        make("stop-speex", "`stop` while the user speaks, Speex, streamed",
             [](Plan& plan) {
                 plan.chunked = plan.speex = true;
                 plan.ending = Plan::Ending::STOP;
             }),
        make("cancel", "`cancel` while the user speaks, streamed",
             [](Plan& plan) {
                 plan.chunked = true;
                 plan.ending = Plan::Ending::CANCEL;
             }),
        make("cancel-sending", "`cancel` while the answer is awaited",
             [](Plan& plan) {
                 plan.gateway = Plan::Gateway::SILENT;
                 plan.ending = Plan::Ending::CANCEL_SENDING;
             }),
        make("release", "release while the user speaks, Speex, streamed",
             [](Plan& plan) {
                 plan.chunked = plan.speex = true;
                 plan.ending = Plan::Ending::RELEASE;
             }),
        make("no-voice", "nobody speaks", [](Plan& plan) { plan.ending = Plan::Ending::NO_VOICE; }),
        make("retry", "the gateway fails once",
             [](Plan& plan) { plan.gateway = Plan::Gateway::FAILS_ONCE; }),
        make("refusal", "the gateway refuses, streamed",
             [](Plan& plan) {
                 plan.chunked = true;
                 plan.gateway = Plan::Gateway::REFUSES;
             }),
        make("silence", "the gateway never answers",
             [](Plan& plan) { plan.gateway = Plan::Gateway::SILENT; }),
        make("usage-log", "usage records beside the session", [](Plan& plan) { plan.logs = true; }),
        make("dump", "the sound is dumped", [](Plan& plan) { plan.dumps = true; }),
        make("dump-speex", "the sound is dumped, Speex, streamed",
             [](Plan& plan) { plan.dumps = plan.chunked = plan.speex = true; }),
        make("file", "recorder that plays a file",
             [](Plan& plan) { plan.sound = Plan::Sound::FILE; }),
        make("network", "the engine asks which networks there are",
             [](Plan& plan) { plan.asksNetwork = true; }),
        make("named", "the gateway has a name", [](Plan& plan) { plan.named = true; }),
        make("tls", "the gateway speaks TLS", [](Plan& plan) { plan.tls = true; }),
        make("pulse", "PulseAudio records, `stop`",
             [](Plan& plan) {
                 plan.sound = Plan::Sound::SERVER;
                 plan.ending = Plan::Ending::STOP;
             }),
    };
}

}  // namespace

const std::vector<Plan>& getPlans() {
    static const std::vector<Plan> plans = makePlans();
    return plans;
}

int findPlan(const std::string& name) {
    for (std::size_t i = 0; i < getPlans().size(); ++i) {
        if (name == getPlans()[i].name) {
            return static_cast<int>(i);
        }
    }
    return -1;
}

const char* getName(Kind kind) {
    return KIND_NAMES[static_cast<std::size_t>(kind)];
}

int findKind(const std::string& name) {
    for (std::size_t i = 0; i < KIND_NAMES.size(); ++i) {
        if (name == KIND_NAMES[i]) {
            return static_cast<int>(i);
        }
    }
    return -1;
}

}  // namespace Torture
