// Recognises what is said into the default microphone. Ends with the end of speech.
// usage: microphone [GATEWAY]
#include "Session.h"

int main(int argc, char** argv) {
    // Without a factory of its own, the engine opens the system's microphone.
    return recognize(argc > 1 ? argv[1] : "http://127.0.0.1:8090");
}
