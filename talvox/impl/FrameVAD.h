/**
 * @file
 * Detectors that decide frame by frame.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <string>

#include "talvox/impl/VoiceActivityDetector.h"

namespace Talvox {

/** Cuts buffers into frames of equal length and asks a concrete engine about each. */
class FrameVAD : public VoiceActivityDetector {
  public:
    void setSessionMode(Sound::Recorder::Mode mode) override;

    /**
     * Decides for each frame that ends before the buffer's end. The frame that ends exactly there
     * is left out, and so is what remains behind the last whole frame: nothing is carried over to
     * the next buffer. Frames of no length, or steps of none, give no decision at all.
     */
    void process(const Sound::SoundDataBuffer& buffer) override;

    /** The decision for the last frame so far. */
    bool isSpeech() const override;

    virtual unsigned getFrameSizeInBytes() const = 0;
    /** Distance of two frames' beginnings; the frame size unless the engine says otherwise. */
    virtual unsigned getFrameStepInBytes() const;
    /** @param frame `getFrameSizeInBytes` bytes @return true for speech */
    virtual bool processFrame(const unsigned char* frame) = 0;

    /** The engine for "" and "wrtc"; another name is logged and gets the same. Never null. */
    static boost::shared_ptr<FrameVAD> create(const std::string& subengine);

  private:
    // Unknown: engines keep the format themselves.
    [[maybe_unused]] Sound::SoundDataInfo info;
    bool lastDecision = false;
};

}  // namespace Talvox
