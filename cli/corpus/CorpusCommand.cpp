#include "CorpusCommand.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>

#include "CorpusFiles.h"
#include "Labeller.h"
#include "cli/ExitStatus.h"
#include "cli/Progress.h"
#include "cli/Text.h"
#include "cli/UsageError.h"

namespace Cli {

namespace {

const int UTTERANCES_MAX = 99;
const int TAIL_MS_MAX = 10000;
const int NOISE_ALONE_S_MAX = 600;

std::string hexText(uint64_t number) {
    static const char DIGITS[] = "0123456789abcdef";
    std::string text;
    for (int shift = 60; shift >= 0; shift -= 4) {
        text += DIGITS[number >> static_cast<unsigned>(shift) & 0xFU];
    }
    return text;
}

CLI::App* addMake(CLI::App& corpus, CorpusOptions& options) {
    CLI::App* command = corpus.add_subcommand(
        "make", "Generate a corpus: speech of flite in noise, with labels from the clean sound");
    CorpusPlan& plan = options.plan;
    command->add_option("DIR", options.folder, "Folder for the corpus")->required();
    command->add_option("--seed", plan.seed, "Number from which the whole corpus follows [1]")
        ->type_name("N");
    command
        ->add_option("--utterances", plan.utterances,
                     "Utterances in clean sound, and in each noise at each ratio [36]")
        ->type_name("N")
        ->check(CLI::Range(1, UTTERANCES_MAX).description(""));
    command
        ->add_option(
            "--noise", plan.noises,
            "Kinds of noise, separated by commas [white,pink,wind,hum,clicks,tones,babble]")
        ->type_name("KINDS")
        ->delimiter(',')
        ->check(CLI::IsMember(corpusNoises()));
    command
        ->add_option("--ratio", plan.ratiosDb,
                     "Ratios of speech to noise in dB, separated by commas [30,20,10,5,0]")
        ->type_name("DB")
        ->delimiter(',')
        ->check(CLI::IsMember(corpusRatiosDb()));
    command
        ->add_option("--tail", plan.tailMs,
                     "Sound behind the last word in ms; an end that a detector finds later is not "
                     "seen [3000]")
        ->type_name("MS")
        ->check(CLI::Range(0, TAIL_MS_MAX).description(""));
    command
        ->add_option("--noise-alone", plan.noiseAloneS,
                     "Length of the files of noise without speech, in seconds [60]")
        ->type_name("S")
        ->check(CLI::Range(0, NOISE_ALONE_S_MAX).description(""));
    command->footer(
        "Utterances have one to three parts with pauses of 0.1 to 2 s between them, leads of 0.2,\n"
        "0.5 and 1.5 s, peaks of 300, 2000 and 8000, and rates of 8 and 16 kHz. By default there\n"
        "are 1,324 files, 2.7 hours of sound, 240 MB. Equal options give equal bytes, provided\n"
        "that flite gives equal speech, of which the last line prints a checksum.");
    return command;
}

CLI::App* addLabel(CLI::App& corpus, CorpusOptions& options) {
    CLI::App* command = corpus.add_subcommand(
        "label", "Propose labels for recordings that have none, by their energy");
    command->add_option("DIR", options.folder, "Folder with recordings")->required();
    command->add_flag("--replace", options.replacesLabels, "Replace label files that exist");
    command->footer(
        "Beside each sound, such as a.wav, it writes a.txt: start, end and text, separated by\n"
        "tabs, as Audacity reads and writes labels. Correct them there or in any editor. A sound\n"
        "without speech has one label with the text (noise).\n"
        "Exit status: 0 all sounds have labels, 2 wrong usage or unreadable sounds.");
    return command;
}

void writeText(const std::string& path, const std::string& text) {
    std::ofstream file(path, std::ios::binary);
    file << text;
    if (!file.flush()) {
        throw UsageError("cannot write to " + path + ": " + std::strerror(errno));
    }
}

void labelSound(const CorpusEntry& entry, std::ostream& out) {
    const CorpusSound sound = readSound(entry);
    const std::vector<Label> speech = proposeLabels(sound);
    writeText(entry.labelPath, labelText(speech, sound.lengthMs()));
    out << printable(entry.name) << ": ";
    if (speech.empty()) {
        out << "no speech found\n";
        return;
    }
    out << speech.size() << (speech.size() == 1 ? " stretch" : " stretches") << " of speech from "
        << fixed(static_cast<double>(speech.front().startMs) / 1000, 0, 2) << " to "
        << fixed(static_cast<double>(speech.back().endMs) / 1000, 0, 2) << " s\n";
}

}  // namespace

CorpusCommand::CorpusCommand(CLI::App& tool) {
    CLI::App* corpus =
        tool.add_subcommand("corpus", "Make a corpus of labelled sound, or label recordings");
    corpus->require_subcommand(1);
    make_ = addMake(*corpus, options_);
    label_ = addLabel(*corpus, options_);
}

bool CorpusCommand::isParsed() const {
    return make_->parsed() || label_->parsed();
}

int CorpusCommand::run(Console& console, LogOutput& log) const {
    // The WAV files that it writes log their closing; recordings may be cut, which is worth a line.
    log.show(label_->parsed());
    return make_->parsed() ? runCorpusMake(options_, console) : runCorpusLabel(options_, console);
}

int runCorpusMake(const CorpusOptions& options, Console& console) {
    CorpusSummary summary;
    {
        Progress progress(console.err, console.errIsTerminal);
        summary = makeCorpus(options.folder, options.plan,
                             [&progress](double share) { progress.show(share); });
    }
    console.out << summary.files << " files, "
                << fixed(static_cast<double>(summary.soundMs) / 60000, 0, 1)
                << " minutes of sound\n"
                << "speech of flite: checksum " << hexText(summary.speechChecksum) << '\n';
    return EXIT_OK;
}

int runCorpusLabel(const CorpusOptions& options, Console& console) {
    int status = EXIT_OK;
    for (const CorpusEntry& entry : findSounds(options.folder)) {
        if (!options.replacesLabels && std::filesystem::exists(entry.labelPath)) {
            console.out << printable(entry.name) << ": has labels\n";
            continue;
        }
        try {
            labelSound(entry, console.out);
        } catch (const UsageError& error) {
            console.err << "talvox: " << printable(error.what()) << std::endl;
            status = EXIT_USAGE;
        }
    }
    return status;
}

}  // namespace Cli
