#include "network/curl/Handles.h"

#include <new>
#include <utility>

#include "network/curl/CurlTransfer.h"

namespace Network {

namespace {

bool isTlsFailure(CURLcode result) {
    return result == CURLE_SSL_CONNECT_ERROR || result == CURLE_PEER_FAILED_VERIFICATION ||
           result == CURLE_SSL_CERTPROBLEM || result == CURLE_SSL_CACERT_BADFILE;
}

}  // namespace

Handle Handles::take(const std::string& certificateFile) {
    Handle handle;
    if (spare.certificateFile == certificateFile) {
        handle.easy = std::move(spare.easy);
    }
    // One for other authorities goes now, and this name is the one that `giveBack` compares with.
    spare.easy.reset();
    spare.certificateFile = certificateFile;
    handle.certificateFile = certificateFile;
    const bool isKept = static_cast<bool>(handle.easy);
    if (!isKept) {
        handle.easy.reset(curl_easy_init());
    }
    const bool isUsable = handle.easy && (isKept || setUp(handle)) && setAuthorities(handle);
    if (!isUsable) {
        handle.easy.reset();  // half set up, it must not serve any request
    }
    return handle;
}

bool Handles::setUp(const Handle& handle) {
    sockets.attach(handle.easy.get());
    return CurlTransfer::setUpHandle(handle.easy.get());
}

bool Handles::setAuthorities(const Handle& handle) {
    CURL* const easy = handle.easy.get();
    // How long libcurl may use what it has read.
    const long cacheS = hasFailedTls ? 0 : AUTHORITY_CACHE_S;
    // A libcurl that keeps nothing does not know the option.
    if (curl_easy_setopt(easy, CURLOPT_CA_CACHE_TIMEOUT, cacheS) == CURLE_OUT_OF_MEMORY) {
        return false;
    }
    try {
        return privateAuthorities.attach(easy, handle.certificateFile, hasFailedTls) &&
               authorities.attach(easy, privateAuthorities.getText(), hasFailedTls);
    } catch (const std::bad_alloc&) {
        return false;
    }
}

void Handles::giveBack(Handle handle) {
    if (handle.certificateFile != spare.certificateFile) {
        return;
    }
    // What the next request sets may be written there.
    curl_easy_setopt(handle.easy.get(), CURLOPT_ERRORBUFFER, nullptr);
    spare.easy = std::move(handle.easy);
}

// Authorities that were read while memory was short are kept with what is missing in them. So
// after a failure each connection reads them again.
void Handles::noteEnd(CURLcode result) {
    hasFailedTls = hasFailedTls || isTlsFailure(result);
}

}  // namespace Network
