#include "talvox/VadAnalysis.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <boost/pointer_cast.hpp>
#include <limits>
#include <utility>

#include "core/sound/RecorderFormat.h"
#include "core/sound/ZeroWatch.h"
#include "core/util/Time.h"
#include "talvox/impl/BufferedVAD.h"
#include "talvox/impl/FrameVAD.h"
#include "talvox/impl/ListeningRules.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoicePowerEstimator.h"

namespace Talvox {

namespace {

using Util::NS_PER_MS;

/** Stands before a frame detector and notes its decisions. */
class NotingFrameVAD : public FrameVAD {
  public:
    explicit NotingFrameVAD(const boost::shared_ptr<FrameVAD>& frameDetector)
        : frameVad(frameDetector) {}

    void setSoundDataInfo(const Sound::SoundDataInfo& format) override {
        frameVad->setSoundDataInfo(format);
    }
    void setSessionMode(Sound::Recorder::Mode mode) override { frameVad->setSessionMode(mode); }
    int getLeadingNoiseMS() const override { return frameVad->getLeadingNoiseMS(); }
    void start() override { frameVad->start(); }
    void processNoise(const Sound::SoundDataBuffer& buffer) override {
        frameVad->processNoise(buffer);
    }
    void cancel() override { frameVad->cancel(); }
    void setParameter(const std::string& name, const std::string& value) override {
        frameVad->setParameter(name, value);
    }
    unsigned getFrameSizeInBytes() const override { return frameVad->getFrameSizeInBytes(); }
    unsigned getFrameStepInBytes() const override { return frameVad->getFrameStepInBytes(); }
    bool processFrame(const unsigned char* frame) override {
        const bool decision = frameVad->processFrame(frame);
        decisions.push_back(decision);
        return decision;
    }

    /** The decisions since the last call. */
    std::vector<bool> takeDecisions() { return std::exchange(decisions, {}); }

  private:
    const boost::shared_ptr<FrameVAD> frameVad;
    std::vector<bool> decisions;
};

float shareOfSpeech(const std::vector<bool>& decisions) {
    if (decisions.empty()) {
        return std::numeric_limits<float>::quiet_NaN();
    }
    const auto ones = std::count(decisions.begin(), decisions.end(), true);
    return static_cast<float>(ones) / static_cast<float>(decisions.size());
}

}  // namespace

struct VadAnalyzer::Impl {
    boost::shared_ptr<NotingFrameVAD> frameVad;
    boost::shared_ptr<VoiceActivityDetector> vad;
    VoicePowerEstimator powerEstimator;
    int sampleRate = 0;
    int64_t deviceDelayNs = 0;
    int64_t samplesSeen = 0;
    unsigned recordedMs = 0;
    bool leadingNoiseDone = false;
    std::vector<VadSegment> segments;

    int64_t soundTimeNs() const {
        const Sound::RecorderFormat format(sampleRate, ListeningRules::BUFFER_LENGTH_MS);
        return sampleRate > 0 ? format.getDurationNs(samplesSeen) : 0;
    }

    int64_t sinceStartNs() const { return soundTimeNs() + deviceDelayNs; }

    void learnNoise(const Sound::SoundDataBuffer& buffer, VadBufferAnalysis& analysis) {
        powerEstimator.learnNoise(buffer);
        vad->processNoise(buffer);
        analysis.learningNoise = true;
        analysis.level = powerEstimator.getNoiseLevel();
        leadingNoiseDone = ListeningRules::isNoiseLearned(
            sinceStartNs(), static_cast<unsigned>(vad->getLeadingNoiseMS()));
        analysis.step = leadingNoiseDone ? ListeningStep::RECORDING_BEGINS : ListeningStep::GO_ON;
    }

    void detect(const Sound::SoundDataBuffer& buffer, VadBufferAnalysis& analysis) {
        powerEstimator.updatePower(buffer);
        analysis.level = powerEstimator.getLevel();
        const bool wasSpeech = vad->isSpeech();
        vad->process(buffer);
        analysis.isSpeech = vad->isSpeech();
        analysis.step =
            ListeningRules::decide(wasSpeech, analysis.isSpeech, recordedMs, sinceStartNs());
        analysis.decisions = frameVad->takeDecisions();
        const auto buffered = boost::dynamic_pointer_cast<const BufferedVAD>(vad);
        analysis.activity = buffered != nullptr ? buffered->getActivity(wasSpeech)
                                                : shareOfSpeech(analysis.decisions);
        if (analysis.isSpeech && !wasSpeech) {
            segments.push_back({analysis.endMs, analysis.endMs});
        } else if (wasSpeech) {
            segments.back().endMs = analysis.endMs;
        }
    }
};

VadAnalyzer::VadAnalyzer(const std::string& vadParameters, int sampleRateHz,
                         Sound::Recorder::Mode mode, int deviceDelayMs)
    : impl(std::make_unique<Impl>()) {
    Impl& self = *impl;
    self.sampleRate = sampleRateHz;
    self.deviceDelayNs = deviceDelayMs * NS_PER_MS;
    self.powerEstimator.setMode(mode);
    self.vad = VoiceActivityDetector::create(
        vadParameters, [&self](const boost::shared_ptr<FrameVAD>& frameDetector) {
            self.frameVad = boost::make_shared<NotingFrameVAD>(frameDetector);
            return self.frameVad;
        });
    self.vad->setSoundDataInfo(
        Sound::SoundDataInfo(Sound::SoundDataInfo::NONE, 1, sampleRateHz, 2));
    self.vad->setSessionMode(mode);
    self.vad->start();
}

VadAnalyzer::~VadAnalyzer() = default;

VadBufferAnalysis VadAnalyzer::analyze(const Sound::SoundDataBuffer& buffer) {
    VadBufferAnalysis analysis;
    analysis.startMs = impl->soundTimeNs() / NS_PER_MS;
    impl->samplesSeen += buffer.getSampleCount();
    impl->recordedMs += ListeningRules::getDurationMs(buffer);
    analysis.endMs = impl->soundTimeNs() / NS_PER_MS;
    analysis.isDigitalSilence = Sound::ZeroWatch::isSilence(buffer);
    analysis.arrivalMs = impl->sinceStartNs() / NS_PER_MS;
    if (impl->leadingNoiseDone) {
        impl->detect(buffer, analysis);
    } else {
        impl->learnNoise(buffer, analysis);
    }
    return analysis;
}

std::vector<VadSegment> VadAnalyzer::segments() const {
    return impl->segments;
}

}  // namespace Talvox
