/**
 * @file
 * Recognition in one request that is streamed while the user speaks.
 */
#pragma once

#include <boost/shared_ptr.hpp>

#include "talvox/impl/ParallelEncoder.h"
#include "talvox/impl/RecognizeProtocol.h"

namespace Talvox {

/**
 * Opens the request with the first buffer and writes the sound into it as it comes, so that the
 * upload is almost done when the user stops speaking.
 */
class ChunkedRecognizeProtocol : public RecognizeProtocol {
  public:
    explicit ChunkedRecognizeProtocol(const Recognizer* user);
    ~ChunkedRecognizeProtocol() override;

    void handle(boost::shared_ptr<const Sound::SoundDataBuffer> buffer) override;
    void sendRequest() override;

  private:
    void openRequest();
    void encode(const boost::shared_ptr<const Sound::SoundDataBuffer>& buffer);
    /** @return false when there is nothing to close: no sound was ever handled */
    bool closeRequest();

    const Recognizer* recognizer;
    bool useSpeex;
    boost::shared_ptr<ParallelEncoder> encoder;
    Network::NetworkTaskHolder holder;
    boost::shared_ptr<RecognizeRequest> request;
    boost::shared_ptr<Util::Timer> timer;
    bool sent = false;
};

}  // namespace Talvox
