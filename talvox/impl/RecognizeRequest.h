/**
 * @file
 * One request to the recognition service.
 */
#pragma once

#include <boost/shared_ptr.hpp>
#include <functional>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "core/network/HttpRequest.h"
#include "core/network/NetworkTask.h"
#include "core/network/NetworkTaskWriter.h"
#include "core/sound/SoundDataBuffer.h"
#include "talvox/RecognitionResult.h"
#include "talvox/SessionObserver.h"
#include "talvox/Settings.h"

namespace Talvox {

/**
 * A multipart POST with who asks, how to recognise and the sound; the answer's hypotheses come in
 * a response header. Its user sets the fields before it submits the request: `chunked` and
 * `writer` to stream the sound through `write`, or `sound` to send it in one piece, and `callback`
 * in both cases. Used under the event lock only.
 */
class RecognizeRequest : public Network::NetworkTask, public Network::TransferTap {
  public:
    using Callback = std::function<void(boost::shared_ptr<const RecognitionResults>, std::string)>;

    /** Works on copies of both settings. */
    RecognizeRequest(const Settings& engine, const Settings& recognizer);
    ~RecognizeRequest() override;

    bool isReadyToPerform() const override;
    /** Without a uuid, language or model, the request is built all the same, but refused. */
    boost::shared_ptr<Network::HttpRequest> issueRequest() const override;
    void onResponseRecieved(boost::shared_ptr<Network::HttpResponse> response) override;
    void onBytesReceived(const std::vector<unsigned char>& bytes) override;
    void onFinished(int code) override;
    boost::shared_ptr<Network::TransferListener> tapTransfer(
        const Network::HttpRequest& request,
        const boost::shared_ptr<Network::TransferListener>& listener) override;

    using Network::NetworkTask::getPriority;
    /** 1 for an upload of hypotheses, 3 for a recognition; not what the network library sees. */
    virtual int getPriority();

    /** Writes all of the streamed body that comes before the sound. */
    void writeBodyStart();
    /** Writes bytes of the sound. */
    void write(const void* data, unsigned size);
    /**
     * Ends the streamed body; a second call does nothing.
     * @param finished false tells the service that the recognition was cancelled
     */
    void close(bool finished);

    /** Why there are no results, when the request is over; empty before that or when there are. */
    const std::string& getNoResultsReason() const { return noResultsReason; }
    /** The HTTP status of the answer, when the request is over; absent without an answer. */
    std::optional<int> getStatus() const { return finalStatus; }

    /** Set when a readable results header has arrived. */
    bool resultsReceived = false;
    /** Where a streamed body goes. */
    boost::shared_ptr<Network::NetworkTaskWriter> writer;
    const Settings& engineSettings;
    const Settings& recognizerSettings;
    /** Whether the body is streamed. */
    bool chunked = false;
    /** Whether `close` has run. */
    bool closed = false;
    /** MIME type of the sound. */
    std::string contentType;
    boost::shared_ptr<Network::HttpRequest::MultipartBuilder> multipart;
    /** The whole utterance of a request that is not streamed. */
    boost::shared_ptr<const Sound::SoundDataBuffer> sound;
    /** Observes the attempts; null for nothing. */
    boost::shared_ptr<SessionObserver> observer;
    /** Reserved for a response that is read in parts. */
    boost::shared_ptr<void> partsHandler;
    /** Told once when the request is over; null results mean that none arrived. */
    Callback callback;
    /** Hypotheses to upload, or those received. */
    boost::shared_ptr<RecognitionResults> results;
    /** The service's identifier of the request. */
    std::string requestId;
    /** Where uploaded hypotheses come from; see `TranscriptsOrigin`. */
    std::string source;
    std::string defaultLanguage;
    std::string topic;

  private:
    using Field = std::pair<std::string, std::string>;

    RecognizeRequest(boost::shared_ptr<const Settings> engine,
                     boost::shared_ptr<const Settings> recognizer);

    /** Name and value of what both kinds of body begin with. */
    std::vector<Field> makeFields() const;
    void refuseIncomplete(Network::HttpRequest& http) const;
    void fillChunked(Network::HttpRequest& http) const;
    void fillWhole(Network::HttpRequest& http) const;
    void addTranscripts(Network::HttpRequest::MultipartBuilder& builder) const;
    void addSound(Network::HttpRequest::MultipartBuilder& builder) const;
    std::string makeField(const std::string& name, const std::string& value) const;
    void writeText(const std::string& text);

    /** @param status as for `onFinished` */
    std::string describeNoResults(int status) const;

    boost::shared_ptr<const Settings> engineCopy;
    boost::shared_ptr<const Settings> recognizerCopy;
    int attempts = 0;
    /** Whether the latest response had a results header that could not be read. */
    bool isUnreadable = false;
    std::string noResultsReason;
    std::optional<int> finalStatus;
};

}  // namespace Talvox
