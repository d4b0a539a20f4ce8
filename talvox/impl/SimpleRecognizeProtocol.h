/**
 * @file
 * Recognition in one request after the user has spoken.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "talvox/impl/ParallelEncoder.h"
#include "talvox/impl/RecognizeProtocol.h"

namespace Talvox {

/** Gathers the whole utterance and sends it in one piece. */
class SimpleRecognizeProtocol : public RecognizeProtocol {
  public:
    explicit SimpleRecognizeProtocol(const Recognizer* user);
    ~SimpleRecognizeProtocol() override;

    void handle(boost::shared_ptr<const Sound::SoundDataBuffer> buffer) override;
    void sendRequest() override;

  private:
    void encode(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer);
    void append(const Sound::SoundDataBuffer& buffer);
    void makeHttpRequest(const boost::shared_ptr<const Sound::SoundDataBuffer>& utterance);

    const Recognizer* recognizer;
    bool useSpeex;
    boost::shared_ptr<ParallelEncoder> encoder;
    boost::shared_ptr<Sound::SoundDataBuffer> sound;
    Network::NetworkTaskHolder holder;
    boost::shared_ptr<Util::Timer> timer;
    bool sent = false;
};

}  // namespace Talvox
