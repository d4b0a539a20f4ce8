#include "talvox/VadAnalysis.h"

#include <algorithm>
#include <boost/make_shared.hpp>
#include <boost/pointer_cast.hpp>
#include <limits>
#include <utility>

#include "talvox/impl/BufferedVAD.h"
#include "talvox/impl/FrameVAD.h"
#include "talvox/impl/VoiceActivityDetector.h"
#include "talvox/impl/VoicePowerEstimator.h"

namespace Talvox {

namespace {

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
    int64_t samplesSeen = 0;
    bool leadingNoiseDone = false;
    std::vector<VadSegment> segments;

    int64_t nowMs() const { return sampleRate > 0 ? samplesSeen * 1000 / sampleRate : 0; }

    void learnNoise(const Sound::SoundDataBuffer& buffer, VadBufferAnalysis& analysis) {
        powerEstimator.learnNoise(buffer);
        vad->processNoise(buffer);
        analysis.learningNoise = true;
        analysis.level = powerEstimator.getNoiseLevel();
        // A session asks whether more than the leading noise has passed on the clock. A buffer
        // reaches it a moment after its last sample, so at its end the answer is yes already.
        leadingNoiseDone = analysis.endMs >= vad->getLeadingNoiseMS();
    }

    void detect(const Sound::SoundDataBuffer& buffer, VadBufferAnalysis& analysis) {
        powerEstimator.updatePower(buffer);
        analysis.level = powerEstimator.getLevel();
        const bool wasSpeech = vad->isSpeech();
        vad->process(buffer);
        analysis.isSpeech = vad->isSpeech();
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
                         Sound::Recorder::Mode mode)
    : impl(std::make_unique<Impl>()) {
    Impl& self = *impl;
    self.sampleRate = sampleRateHz;
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
    analysis.startMs = impl->nowMs();
    impl->samplesSeen += buffer.getSampleCount();
    analysis.endMs = impl->nowMs();
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
