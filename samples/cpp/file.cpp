// Recognises a file of raw 16-bit little-endian mono sound at 16 kHz.
// usage: file SOUND.raw [GATEWAY]
#include <core/sound/FileRecorder.h>

#include "Session.h"

int main(int argc, char** argv) {
    if (argc < 2) {
        std::cerr << "usage: file SOUND.raw [GATEWAY]" << std::endl;
        return 2;
    }
    const std::vector<int16_t> samples = readSamples(argv[1]);
    if (samples.empty()) {
        std::cerr << "cannot read " << argv[1] << std::endl;
        return 2;
    }
    // Every session asks the factory for its recorder. This one plays the samples at their own
    // pace, then silence.
    Sound::Recorder::setFactory(
        [&samples] { return boost::make_shared<Sound::FileRecorder>(samples); });
    return recognize(argc > 2 ? argv[2] : "http://127.0.0.1:8090");
}
