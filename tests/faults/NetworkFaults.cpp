#include "Catalogue.h"
#include "core/network/NetworkManager.h"
#include "teardown/app/SilentNameServer.h"

namespace FaultTest {

using CloudTest::answerGoForward;

namespace {

constexpr int LONG_UTTERANCE = 3;  // sentences

/** The server takes so much of the body in each step. */
std::function<void(Surroundings&)> taking(std::size_t bytesAtOnce) {
    return [bytesAtOnce](Surroundings& around) {
        TestSupport::ScriptedHttpServer& gateway = around.gateway();
        gateway.narrow();
        gateway.setDefaultAnswer(answerGoForward().readingInPieces(bytesAtOnce));
        around.say(makeUtterance(LONG_UTTERANCE));
        around.atEachStep([&gateway](int64_t) {
            if (gateway.getRequestCount() > 0) {
                gateway.release();
            }
        });
    };
}

/** The network is away between two times of the session, the second one excluded. */
std::function<void(Surroundings&)> away(int64_t fromMs, int64_t toMs) {
    return [fromMs, toMs](Surroundings& around) {
        TestSupport::ScriptedHttpServer& gateway = around.gateway();
        if (fromMs == 0) {
            gateway.goAway();
        }
        around.atEachStep([&gateway, fromMs, toMs](int64_t elapsedMs) {
            if (elapsedMs == fromMs) {
                gateway.goAway();
            } else if (elapsedMs == toMs) {
                gateway.comeBack();
            }
        });
    };
}

/** What the system says of the network from a time of the session on. */
std::function<void(Surroundings&)> unreachableFrom(int64_t fromMs) {
    return [fromMs](Surroundings& around) {
        const auto cut = [] {
            Network::NetworkManager::getInstance().overrideReachability(
                Network::NetworkManager::UNREACHABLE);
        };
        if (fromMs == 0) {
            cut();
        }
        around.atEachStep([fromMs, cut](int64_t elapsedMs) {
            if (elapsedMs == fromMs) {
                cut();
            }
        });
    };
}

}  // namespace

Chapter makeNetworkFaults() {
    return {"The network",
            {
                {"TricklesFastEnough",
                 "the upload is taken at 8 KB in 0.1 s",
                 {WORDS, 1},
                 {WORDS, 1},
                 taking(8000)},
                {"TricklesSlowly",
                 "the upload is taken at 2 KB in 0.1 s",
                 {WORDS, 1},
                 {WORDS, 1},
                 taking(2000)},
                {"TricklesTooSlowly",
                 "the upload is taken at 500 bytes in 0.1 s",
                 {NETWORK_ERROR, 1},
                 {NETWORK_ERROR, 1},
                 taking(500)},
                {"AwayAtStart",
                 "away from the start, back after 1.5 s",
                 {WORDS, 1},
                 {WORDS, 1},
                 away(0, 1500)},
                {"AwayInSpeech",
                 "away 1.2 s after the start, back after 1.5 s",
                 {WORDS, 1},
                 {WORDS, 2},
                 away(1200, 2700)},
                {"AwayTooLong",
                 "away 1.2 s after the start, back after 2.5 s",
                 {NETWORK_ERROR, 0},
                 {NETWORK_ERROR, 1},
                 away(1200, 30000)},
                {"AwayAfterSpeech",
                 "away 0.4 s before the end of speech is found, back after 1.5 s",
                 {WORDS, 1},
                 {WORDS, 2},
                 away(2500, 4000)},
                {"Unreachable",
                 "the system says that there is no network",
                 {NETWORK_ERROR, 0},
                 {NETWORK_ERROR, 0},
                 unreachableFrom(0)},
                {"UnreachableInSpeech",
                 "the system says so 1.2 s after the start, but it works",
                 {WORDS, 1},
                 {WORDS, 1},
                 unreachableFrom(1200)},
                {"SilentNameServer",
                 "the name server does not answer",
                 {NETWORK_ERROR, 0},
                 {NETWORK_ERROR, 0},
                 [](Surroundings& around) {
                     around.putUrl(std::string("http://") + TearDown::SILENT_HOST);
                 }},
            }};
}

}  // namespace FaultTest
