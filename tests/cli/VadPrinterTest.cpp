#include <gtest/gtest.h>

#include <initializer_list>
#include <limits>
#include <sstream>

#include "Events.h"
#include "cli/HumanVad.h"
#include "cli/JsonVad.h"

namespace {

using Talvox::VadBufferAnalysis;
using Talvox::VadSegment;

VadBufferAnalysis noise() {
    VadBufferAnalysis buffer;
    buffer.startMs = 0;
    buffer.endMs = 100;
    buffer.learningNoise = true;
    buffer.level = 4.5F;
    return buffer;
}

VadBufferAnalysis speech() {
    VadBufferAnalysis buffer;
    buffer.startMs = 200;
    buffer.endMs = 300;
    buffer.decisions = {true, false, true};
    buffer.activity = 0.6F;
    buffer.level = 22.5F;
    buffer.isSpeech = true;
    return buffer;
}

std::string printed(Cli::VadPrinter& printer, const std::ostringstream& out,
                    const std::vector<VadBufferAnalysis>& buffers,
                    const std::vector<VadSegment>& segments, bool lastIsOpen) {
    for (const VadBufferAnalysis& buffer : buffers) {
        printer.printBuffer(buffer);
    }
    printer.printSegments(segments, lastIsOpen);
    return out.str();
}

TEST(JsonVad, PrintsBuffersAndSegmentsAsObjects) {
    std::ostringstream out;
    Cli::JsonVad printer(out);
    EXPECT_EQ(
        printed(printer, out, {noise(), speech()}, {{300, 900}, {1200, 1500}}, true),
        "{\"event\":\"buffer\",\"startMs\":0,\"endMs\":100,\"learningNoise\":true,"
        "\"level\":4.5,\"silence\":false,\"frames\":\"\",\"activity\":0.0,\"speech\":false}\n"
        "{\"event\":\"buffer\",\"startMs\":200,\"endMs\":300,\"learningNoise\":false,"
        "\"level\":22.5,\"silence\":false,\"frames\":\"101\",\"activity\":0.6,\"speech\":true}\n"
        "{\"event\":\"segment\",\"startMs\":300,\"endMs\":900,\"ended\":true}\n"
        "{\"event\":\"segment\",\"startMs\":1200,\"endMs\":1500,\"ended\":false}\n");
}

TEST(JsonVad, PrintsAnActivityThatIsNoNumberAsNull) {
    VadBufferAnalysis buffer = speech();
    buffer.activity = std::numeric_limits<float>::quiet_NaN();
    std::ostringstream out;
    Cli::JsonVad(out).printBuffer(buffer);
    EXPECT_NE(out.str().find("\"activity\":null"), std::string::npos);
}

TEST(HumanVad, PrintsATableAndTheSegments) {
    std::ostringstream out;
    Cli::HumanVad printer(out, false);
    EXPECT_EQ(
        printed(printer, out, {noise(), speech()}, {{300, 900}, {1200, 1500}}, true),
        "level: dB above -60.3 dBFS (full scale is 60.3 dB), smoothed; of the noise: dB above "
        "-45.3 dBFS, summed up\n\n"
        "    from  level                            activity  state   frames (1 speech, 0 "
        "none)\n"
        "     0 ms  [##------------------]   4.5 dB       -  noise   \n"
        "   200 ms  [##########----------]  22.5 dB   0.600  speech  101\n"
        "\n"
        "segments of speech:\n"
        "   300 ms  to   900 ms  (600 ms)\n"
        "  1200 ms  to  1500 ms  (300 ms), still open at the end of the sound\n");
}

TEST(HumanVad, SaysThatLevelsAreAboveTheNoiseInGeneralMode) {
    std::ostringstream out;
    Cli::HumanVad printer(out, true);
    printer.printBuffer(noise());
    EXPECT_EQ(out.str().find("level: dB above the leading noise, smoothed; of the noise: "), 0U);
}

TEST(HumanVad, ShowsDigitalSilenceAsSilence) {
    VadBufferAnalysis buffer = speech();
    buffer.isDigitalSilence = true;
    buffer.level = -87.25F;
    std::ostringstream out;
    Cli::HumanVad(out, false).printBuffer(buffer);
    EXPECT_NE(out.str().find("   200 ms  [--------------------]  silence   0.600  speech  101\n"),
              std::string::npos);
    buffer.level = 30.0F;
    std::ostringstream falling;
    Cli::HumanVad(falling, false).printBuffer(buffer);
    EXPECT_EQ(falling.str(), out.str());
    std::ostringstream json;
    Cli::JsonVad(json).printBuffer(buffer);
    EXPECT_NE(json.str().find("\"level\":30.0,\"silence\":true"), std::string::npos);
}

TEST(VadPrinters, PrintWhatASessionReports) {
    std::ostringstream out;
    std::ostringstream json;
    Cli::HumanVad human(out, false);
    Cli::JsonVad machine(json);
    for (Cli::VadPrinter* printer : std::initializer_list<Cli::VadPrinter*>{&human, &machine}) {
        printer->printSessionEvent(TestSupport::event(Cli::SessionEvent::RECORDING_BEGIN, 220));
        printer->printSessionEvent(TestSupport::event(Cli::SessionEvent::SPEAKING_BEGIN, 320));
        printer->printSessionEvent(TestSupport::event(Cli::SessionEvent::RECORDING_DONE, 920));
        printer->printSessionEvent(TestSupport::failure(5020, 6));
    }
    EXPECT_EQ(out.str(),
              "       -> session, after 220 ms: recording begins\n"
              "       -> session, after 320 ms: speech begins\n"
              "       -> session, after 920 ms: recording is done\n"
              "       -> session, after 5020 ms: error: ErrorNoVoice\n");
    EXPECT_EQ(json.str(),
              "{\"event\":\"recordingBegin\",\"ms\":220}\n"
              "{\"event\":\"speakingBegin\",\"ms\":320}\n"
              "{\"event\":\"recordingDone\",\"ms\":920}\n"
              "{\"event\":\"error\",\"ms\":5020,\"code\":6,\"name\":\"ErrorNoVoice\"}\n");
}

TEST(HumanVad, SaysSoWhenThereWasNoSpeech) {
    std::ostringstream out;
    Cli::HumanVad printer(out, false);
    EXPECT_EQ(printed(printer, out, {}, {}, false), "\nsegments of speech: none\n");
}

}  // namespace
