/**
 * @file
 * What every voice activity detector can do, and the factory that reads the "vad" setting.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <functional>
#include <string>

#include "core/sound/Recorder.h"
#include "core/sound/SoundDataBuffer.h"
#include "core/sound/SoundDataInfo.h"

namespace Talvox {

class FrameVAD;

/**
 * Decides, buffer by buffer, whether speech is heard.
 *
 * Driven in this order: `create`, `setSoundDataInfo`, `setSessionMode`, `start`, `processNoise` for
 * the buffers of the first `getLeadingNoiseMS` milliseconds, then `process` followed by `isSpeech`
 * for each further buffer, and `cancel`. Used by one thread at a time; takes no locks.
 */
class VoiceActivityDetector {
  public:
    /** Puts something around the frame detector that the factory has built, or returns it as is. */
    using FrameDecorator =
        std::function<boost::shared_ptr<FrameVAD>(const boost::shared_ptr<FrameVAD>&)>;

    VoiceActivityDetector() = default;
    VoiceActivityDetector(const VoiceActivityDetector&) = delete;
    VoiceActivityDetector& operator=(const VoiceActivityDetector&) = delete;
    virtual ~VoiceActivityDetector();

    virtual void setSoundDataInfo(const Sound::SoundDataInfo& info) = 0;
    virtual void setSessionMode(Sound::Recorder::Mode mode);
    /** Milliseconds at the beginning that `processNoise` is to learn from. */
    virtual int getLeadingNoiseMS() const;
    virtual void start() = 0;
    virtual void processNoise(const Sound::SoundDataBuffer& buffer);
    virtual void process(const Sound::SoundDataBuffer& buffer) = 0;
    virtual bool isSpeech() const = 0;
    /** Share of speech in the span by which the latest verdict was made; NaN if there is none. */
    virtual float getLatestActivity() const;
    /** Row of the thresholds that the noise has chosen, 0 for the strictest; -1 for none. */
    virtual int getNoiseRow() const;
    virtual void cancel() = 0;
    /** @param name normalised as `create` does it; unknown names are logged and ignored */
    virtual void setParameter(const std::string& name, const std::string& value) = 0;

    /**
     * Builds the detector that `parameters` describes ("name=value;name=value") and applies every
     * parameter, in the order of the names. In names, "_" and blanks do not count, nor does case.
     * What cannot be understood is logged and skipped. Never null.
     */
    static boost::shared_ptr<VoiceActivityDetector> create(const std::string& parameters);

    /** The same with `decorate` applied to the frame detector inside (or to the lone one). */
    static boost::shared_ptr<VoiceActivityDetector> create(const std::string& parameters,
                                                           const FrameDecorator& decorate);
};

}  // namespace Talvox
