// From the recorder's buffer to its bytes at a loopback server, through a whole chunked session,
// next to a bare send over the same kind of connection.
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <boost/make_shared.hpp>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "bench/BenchRecorder.h"
#include "bench/LatencySink.h"
#include "bench/TestSpeech.h"
#include "pal/kd.h"
#include "talvox/RecognizerListenerAdapter.h"
#include "talvox/Talvox.h"

namespace {

constexpr std::size_t BUFFER_SAMPLES = 1600;
constexpr int BUFFERS_PER_SESSION = 190;  // below the limit of 20 seconds of sound
constexpr int SESSIONS = 6;
constexpr int64_t PAUSE_NS = 5LL * 1000 * 1000;

void pause() {
    const timespec time{0, PAUSE_NS};
    nanosleep(&time, nullptr);
}

/** @return the median, in microseconds */
double print(const char* what, std::vector<int64_t> times) {
    if (times.empty()) {
        std::printf("%-34s no measurement\n", what);
        std::exit(1);
    }
    std::sort(times.begin(), times.end());
    const auto at = [&times](double share) {
        return static_cast<double>(
                   times[static_cast<std::size_t>(share * static_cast<double>(times.size() - 1))]) /
               1000;
    };
    std::printf("%-34s %5zu buffers  p50 %7.1f us  p99 %7.1f us\n", what, times.size(), at(0.5),
                at(0.99));
    return at(0.5);
}

boost::shared_ptr<Talvox::Settings> sessionSettings(int port) {
    auto settings = boost::make_shared<Talvox::Settings>();
    settings->putString(Talvox::Settings::SKS_URL, "http://127.0.0.1:" + std::to_string(port));
    settings->putString(Talvox::Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
    settings->putString(Talvox::Settings::SKS_SOUND_FORMAT, Talvox::Settings::SOUND_FORMAT_PCM);
    settings->putString(Talvox::Settings::SKS_VAD_SETTINGS, "activityoff=0");
    settings->putBoolean(Talvox::Settings::SKS_STREAMING, true);
    return settings;
}

std::vector<int64_t> measureSession(const std::vector<int16_t>& speech) {
    Bench::LatencySink sink;
    auto& engine = Talvox::Talvox::getInstance();
    const auto settings = sessionSettings(sink.getPort());
    engine.setTalvoxSettings(settings);
    const auto listener = boost::make_shared<Talvox::RecognizerListenerAdapter>();
    const auto recognizer = engine.createRecognizer(listener, settings);
    recognizer->start();
    std::vector<int64_t> sent;
    for (int i = 0; i < BUFFERS_PER_SESSION; ++i) {
        sent.push_back(kdGetTimeUST());
        Bench::BenchRecorder::current()->deliver(
            speech.data() + static_cast<std::size_t>(i) * BUFFER_SAMPLES, BUFFER_SAMPLES);
        pause();
    }
    recognizer->stop();
    sink.join();

    const std::size_t audio = sink.getBody().find("\r\n\r\n", sink.getBody().find("\"audio\""));
    std::vector<int64_t> times;
    for (std::size_t i = 1; i < sent.size(); ++i) {  // the first one waits for the connection
        const std::size_t last = audio + 4 + (i + 1) * BUFFER_SAMPLES * 2 - 1;
        const int64_t arrival = sink.arrivalOf(last);
        if (arrival >= 0) {
            times.push_back(arrival - sent[i]);
        }
    }
    return times;
}

std::vector<int64_t> measureBareSend() {
    const std::pair<int, int> sockets = Bench::tcpPair();
    std::vector<char> buffer(BUFFER_SAMPLES * 2, 1);
    const int count = SESSIONS * BUFFERS_PER_SESSION;
    std::vector<int64_t> received;
    std::thread reader([&] {
        std::vector<char> in(buffer.size());
        for (int i = 0; i < count; ++i) {
            if (recv(sockets.second, in.data(), in.size(), MSG_WAITALL) <= 0) {
                return;
            }
            received.push_back(kdGetTimeUST());
        }
    });
    std::vector<int64_t> sent;
    for (int i = 0; i < count; ++i) {
        sent.push_back(kdGetTimeUST());
        if (send(sockets.first, buffer.data(), buffer.size(), MSG_NOSIGNAL) < 0) {
            break;
        }
        pause();
    }
    reader.join();
    close(sockets.first);
    close(sockets.second);
    std::vector<int64_t> times;
    for (std::size_t i = 0; i < received.size(); ++i) {
        times.push_back(received[i] - sent[i]);
    }
    return times;
}

}  // namespace

int main() {
    kdSetLogSinkKOR([](const char*, void*) {}, nullptr);
    Bench::BenchRecorder::install();
    const std::vector<int16_t> speech = Bench::testSpeech(20);
    std::vector<int64_t> times;
    for (int i = 0; i < SESSIONS; ++i) {
        const std::vector<int64_t> session = measureSession(speech);
        times.insert(times.end(), session.begin(), session.end());
    }
    const double bare = print("baseline: bare send over TCP", measureBareSend());
    const double session = print("session: recorder to server", times);
    std::printf("%-34s %13.2f (wanted: at most 3)\n", "session / baseline, p50", session / bare);
    return 0;
}
