#include "talvox/impl/RecognizeRequest.h"

#include <boost/make_shared.hpp>
#include <optional>

#include "pal/kd.h"
#include "talvox/Log.h"
#include "talvox/impl/IsPresent.h"
#include "talvox/impl/ObservedTransfer.h"
#include "talvox/impl/RequestFormat.h"
#include "talvox/impl/ResultDocument.h"

namespace Talvox {

namespace {

const char* const SOURCE = "talvox/impl/RecognizeRequest";
const char* const BOUNDARY = "1BEF0A57BE110FD467A";
const char* const RESULTS_HEADER = "x-asrgw-recognition-results";
const char* const REQUEST_ID_HEADER = "x-kvrequestid";

const int LOG_LEVEL = 2;
const int TIMEOUT_MS = 30000;
const int PRIORITY_UPLOAD = 1;
const int PRIORITY_RECOGNITION = 3;

Sound::SoundDataInfo getSentFormat(const Settings& engineSettings) {
    const bool speex =
        engineSettings.getString(Settings::SKS_SOUND_FORMAT) == Settings::SOUND_FORMAT_SPEEX;
    return {speex ? Sound::SoundDataInfo::SPEEX : Sound::SoundDataInfo::NONE, 1,
            engineSettings.getSampleRate(), 2};
}

}  // namespace

RecognizeRequest::RecognizeRequest(const Settings& engine, const Settings& recognizer)
    : RecognizeRequest(boost::make_shared<const Settings>(engine),
                       boost::make_shared<const Settings>(recognizer)) {}

RecognizeRequest::RecognizeRequest(boost::shared_ptr<const Settings> engine,
                                   boost::shared_ptr<const Settings> recognizer)
    : engineSettings(*engine),
      recognizerSettings(*recognizer),
      contentType(makeContentType(getSentFormat(*engine))),
      multipart(Network::HttpRequest::MultipartBuilder::create(BOUNDARY)),
      callback([](const boost::shared_ptr<const RecognitionResults>&, const std::string&) {}),
      engineCopy(std::move(engine)),
      recognizerCopy(std::move(recognizer)) {}

RecognizeRequest::~RecognizeRequest() = default;

int RecognizeRequest::getPriority() {
    return results ? PRIORITY_UPLOAD : PRIORITY_RECOGNITION;
}

bool RecognizeRequest::isReadyToPerform() const {
    KOR_ASSERT_AT(!engineSettings.getUuid().empty(), "talvoxSettings.getUuid() != \"\"", SOURCE,
                  52);
    KOR_ASSERT_AT(!engineSettings.getUrl().empty(), "talvoxSettings.getUrl() != \"\"", SOURCE, 53);
    return true;
}

boost::shared_ptr<Network::HttpRequest> RecognizeRequest::issueRequest() const {
    const std::string url =
        makeRequestUrl(engineSettings, recognizerSettings, chunked, contentType);
    boost::shared_ptr<Network::HttpRequest> http =
        Network::HttpRequest::create(url, "POST", TIMEOUT_MS, false);
    refuseIncomplete(*http);
    http->setChunked(chunked);
    if (chunked) {
        fillChunked(*http);
    } else {
        fillWhole(*http);
    }
    return http;
}

// The service could only guess what is missing, and the sound is the user's voice: it stays here.
void RecognizeRequest::refuseIncomplete(Network::HttpRequest& http) const {
    if (engineSettings.getUuid().empty()) {
        http.refuse("the uuid is empty");
    }
    if (recognizerSettings.getLanguage().empty()) {
        http.refuse("the language is empty");
    }
    if (recognizerSettings.getModel().empty()) {
        http.refuse("the model is empty");
    }
}

void RecognizeRequest::fillChunked(Network::HttpRequest& http) const {
    http.setBoundary(multipart->getBoundary());
    kdLogFormatMessage("Chunked request: %s", http.getUrl().c_str());
    http.addBoundaryHeader();
    http.setWriter(writer);
}

void RecognizeRequest::fillWhole(Network::HttpRequest& http) const {
    kdLogFormatMessage("Non-chunked request: %s", http.getUrl().c_str());
    const boost::shared_ptr<Network::HttpRequest::MultipartBuilder> builder =
        Network::HttpRequest::MultipartBuilder::create(multipart->getBoundary());
    KOR_ASSERT_AT(!engineSettings.getUuid().empty(), "!talvoxSettings.getUuid().empty()", SOURCE,
                  168);
    for (const Field& field : makeFields()) {
        builder->addField(field.first, field.second, false, false, "");
    }
    addTranscripts(*builder);
    addSound(*builder);
    http.setBody(builder->getBoundary(), builder->getEncodedContent());
}

std::vector<RecognizeRequest::Field> RecognizeRequest::makeFields() const {
    KOR_ASSERT_AT(!recognizerSettings.getLanguage().empty(),
                  "!recognizerSettings.getLanguage().empty()", SOURCE, 170);
    KOR_ASSERT_AT(!recognizerSettings.getModel().empty(), "!recognizerSettings.getModel().empty()",
                  SOURCE, 172);
    std::vector<Field> fields = {
        {"uuid", engineSettings.getUuid()},
        {"lang", recognizerSettings.getLanguage()},
        {"topic", recognizerSettings.getModel()},
        {"myll", formatLocation(recognizerSettings.getLatLon(Settings::RS_MY_LL))},
        {"centerll", formatLocation(recognizerSettings.getLatLon(Settings::RS_CENTER_LL))}};
    for (Field& field : fields) {
        field.second = removeSeparators(field.first, field.second, multipart->getBoundary());
    }
    return fields;
}

void RecognizeRequest::addTranscripts(Network::HttpRequest::MultipartBuilder& builder) const {
    if (!results) {
        return;
    }
    const std::string transcripts =
        removeSeparators("transcripts", makeTranscripts(*results, {source, defaultLanguage, topic}),
                         builder.getBoundary());
    tvLogFormatMessage(LOG_LEVEL, "resultsXml: %s", transcripts.c_str());
    builder.addField("transcripts", transcripts, false, false, "");
}

void RecognizeRequest::addSound(Network::HttpRequest::MultipartBuilder& builder) const {
    if (!sound || sound->getData().empty()) {
        return;
    }
    const std::vector<unsigned char>& bytes = sound->getData();
    builder.addField("Content-Type", contentType, false, false, "");
    builder.addField("audio", std::string(bytes.begin(), bytes.end()), false, false, contentType);
    kdLogFormatMessage("request data size %d", static_cast<int>(bytes.size()));
}

void RecognizeRequest::writeBodyStart() {
    KOR_ASSERT_AT(!engineSettings.getUuid().empty(), "!talvoxSettings.getUuid().empty()", SOURCE,
                  63);
    for (const Field& field : makeFields()) {
        writeText(makeField(field.first, field.second));
    }
    writeText(makeField("Content-Type", contentType));
    writeText(multipart->startField("audio", false, false, contentType));
}

void RecognizeRequest::write(const void* data, unsigned size) {
    const boost::shared_ptr<Network::NetworkTaskWriter> current = writer;
    if (isPresent(current)) {
        current->write(data, size);
    }
}

void RecognizeRequest::close(bool finished) {
    if (closed) {
        return;
    }
    closed = true;
    writeText(multipart->endField());
    if (!finished) {
        tvLogFormatMessage(LOG_LEVEL, "Writing cancel field to request");
        writeText(makeField("canceled", "true"));
    }
    writeText(multipart->endEncodedContent());
    if (isPresent(writer)) {
        writer->close();
    }
}

std::string RecognizeRequest::makeField(const std::string& name, const std::string& value) const {
    return multipart->startField(name, false, false, "") + value + multipart->endField();
}

void RecognizeRequest::writeText(const std::string& text) {
    write(text.data(), static_cast<unsigned>(text.size()));
}

void RecognizeRequest::onResponseRecieved(boost::shared_ptr<Network::HttpResponse> response) {
    if (!isPresent(response)) {
        return;
    }
    isUnreadable = false;
    if (const std::optional<std::string> header = response->getHeader(RESULTS_HEADER)) {
        const boost::shared_ptr<RecognitionResults> received = parseResultHeader(*header);
        if (!received) {
            isUnreadable = true;
            return;
        }
        resultsReceived = true;
        results = received;
    }
    if (const std::optional<std::string> identifier = response->getHeader(REQUEST_ID_HEADER)) {
        requestId = *identifier;
    }
}

void RecognizeRequest::onBytesReceived(const std::vector<unsigned char>& /*bytes*/) {
    KOR_ASSERT_AT(!partsHandler, "false && \"Not implemented\"", SOURCE, 294);
}

boost::shared_ptr<Network::TransferListener> RecognizeRequest::tapTransfer(
    const Network::HttpRequest& request,
    const boost::shared_ptr<Network::TransferListener>& listener) {
    if (!observer) {
        return listener;
    }
    observer->onAttempt(++attempts, request);
    return boost::make_shared<ObservedTransfer>(observer, attempts, listener);
}

void RecognizeRequest::onFinished(int code) {
    if (partsHandler) {
        return;
    }
    kdLogFormatMessage("RecognizeRequest::onFinished: res code %d", code);
    finalStatus = code > 0 ? std::make_optional(code) : std::nullopt;
    if (observer) {
        observer->onFinished(code);
    }
    noResultsReason = results ? std::string() : describeNoResults(code);
    // The callback may drop the request.
    const Callback target = callback;
    const boost::shared_ptr<const RecognitionResults> outcome = results;
    const std::string identifier = requestId;
    target(outcome, identifier);
}

std::string RecognizeRequest::describeNoResults(int status) const {
    if (status > 0 && isUnreadable) {
        return "the results in the answer cannot be read (HTTP status " + std::to_string(status) +
               ")";
    }
    return getFailureReason().empty()
               ? "the answer holds no results (HTTP status " + std::to_string(status) + ")"
               : getFailureReason();
}

}  // namespace Talvox
