#include "RecognizeRun.h"

#include <sstream>

#include "SoundFiles.h"
#include "core/util/Base64Coder.h"

namespace TestSupport {

const char* const QUICK_VAD = "analyzemson=200;analyzemsoff=200;minvoicetimems=100";
const char* const UUID = "0123456789abcdef0123456789abcdef";

Answer resultAnswer(const std::string& variants) {
    const std::string xml =
        "<?xml version=\"1.0\" encoding=\"utf-8\"?><recognitionResults "
        "success=\"1\">" +
        variants + "</recognitionResults>";
    const std::vector<unsigned char> bytes(xml.begin(), xml.end());
    return Answer::status(200, {{"x-asrgw-recognition-results", Util::Base64Coder::encode(bytes)},
                                {"x-kvrequestid", "request-7"}});
}

std::string voice() {
    return rawBytes(voiceLike(16000, 0.6));
}

std::vector<std::string> recognize(const std::string& url, const std::vector<std::string>& more) {
    std::vector<std::string> arguments = {"recognize", "--file", "-",     "--url",  url,
                                          "--uuid",    UUID,     "--vad", QUICK_VAD};
    arguments.insert(arguments.end(), more.begin(), more.end());
    return arguments;
}

std::vector<std::string> lines(const std::string& text) {
    std::vector<std::string> found;
    std::istringstream in(text);
    for (std::string line; std::getline(in, line);) {
        found.push_back(line);
    }
    return found;
}

}  // namespace TestSupport
