// What the recognising examples share: the engine's settings, and a listener that prints events.
#pragma once

#include <talvox/RecognizerListenerAdapter.h>
#include <talvox/Talvox.h>

#include <boost/make_shared.hpp>
#include <fstream>
#include <future>
#include <iostream>
#include <string>
#include <vector>

/** Prints what happens. Called on the engine's event thread, so it must not block. */
class Printer : public Talvox::RecognizerListenerAdapter {
  public:
    void onRecordingBegin(Talvox::Recognizer*) override { std::cout << "speak now" << std::endl; }
    void onSpeakingBegin(Talvox::Recognizer*) override { std::cout << "speech" << std::endl; }
    void onRecordingDone(Talvox::Recognizer*) override { std::cout << "sending" << std::endl; }
    void onResults(Talvox::Recognizer*,
                   boost::shared_ptr<Talvox::Recognition> recognition) override {
        for (const Talvox::RecognitionResult& hypothesis : *recognition->getResults()) {
            std::cout << hypothesis.getConfidence() << " " << hypothesis.getText() << std::endl;
        }
        exitStatus.set_value(0);
    }
    void onError(Talvox::Recognizer* recognizer, Talvox::SpeechError error) override {
        std::cerr << error.getErrorString() << ": " << recognizer->getErrorReason() << std::endl;
        exitStatus.set_value(1);
    }

    /** Waits for the terminal event. */
    int wait() { return exitStatus.get_future().get(); }

  private:
    std::promise<int> exitStatus;
};

/** Address, identifier and language. The first two count on the engine, the third on a recognizer.
 */
inline boost::shared_ptr<Talvox::Settings> makeSettings(const std::string& gateway) {
    auto settings = boost::make_shared<Talvox::Settings>();
    settings->putString(Talvox::Settings::SKS_URL, gateway);
    settings->putString(Talvox::Settings::SKS_UUID, "0123456789abcdef0123456789abcdef");
    settings->putString(Talvox::Settings::RS_LANGUAGE, "en-US");
    return settings;
}

/** Runs one session. @return the exit status of the program */
inline int recognize(const std::string& gateway) {
    const boost::shared_ptr<Talvox::Settings> settings = makeSettings(gateway);
    Talvox::Talvox& engine = Talvox::Talvox::getInstance();
    engine.setTalvoxSettings(settings);
    // The recognizer holds its listener weakly: keep both until the terminal event.
    const auto printer = boost::make_shared<Printer>();
    const boost::shared_ptr<Talvox::Recognizer> recognizer =
        engine.createRecognizer(printer, settings);
    recognizer->start();
    return printer->wait();
}

/** The samples of a file of raw 16-bit little-endian mono sound. */
inline std::vector<int16_t> readSamples(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    std::vector<int16_t> samples;
    for (char bytes[2]; file.read(bytes, 2);) {
        const auto low = static_cast<unsigned char>(bytes[0]);
        samples.push_back(static_cast<int16_t>(low | static_cast<unsigned char>(bytes[1]) << 8));
    }
    return samples;
}
