#include "gateway/Page.h"

#include <cstdlib>

#include "gateway/Loopback.h"
#include "gateway/PageAssets.h"

namespace Gateway::Page {

namespace {

constexpr const char* FOLDER = "/page/";

constexpr const char* POLICY =
    "default-src 'none'; script-src 'self'; style-src 'self'; connect-src 'self'; "
    "media-src blob:; img-src data:; base-uri 'none'; form-action 'none'; frame-ancestors 'none'; "
    "require-trusted-types-for 'script'; trusted-types 'none'";

Answer makeAnswer(const std::string& contentType, const std::string& body) {
    Answer answer;
    answer.contentType = contentType;
    answer.body = body;
    return answer;
}

uint64_t toNumber(const std::string& text) {
    return std::strtoull(text.c_str(), nullptr, 10);
}

Answer makeSound(const SessionList& sessions, const std::string& id) {
    const std::string wav = sessions.makeWav(toNumber(id));
    return wav.empty() ? Answer::refuse(404, "there is no sound of this session")
                       : makeAnswer("audio/wav", wav);
}

Answer find(const SessionList& sessions, const PageRequest& request) {
    if (!namesLoopback(request.host)) {
        return Answer::refuse(403, "the page is for this machine: call it by a loopback address");
    }
    if (request.path == "/") {
        return makeAnswer("text/html; charset=utf-8", PAGE_HTML);
    }
    const std::string part = request.path.substr(std::string(FOLDER).size());
    if (part == "page.css") {
        return makeAnswer("text/css; charset=utf-8", PAGE_CSS);
    }
    if (part == "page.js") {
        return makeAnswer("text/javascript; charset=utf-8", PAGE_JS);
    }
    if (part == "changes") {
        return makeAnswer("application/json",
                          sessions.describeChanges(request.instance, toNumber(request.after)));
    }
    return part == "sound" ? makeSound(sessions, request.id)
                           : Answer::refuse(404, "the page has no such part");
}

}  // namespace

bool owns(const std::string& path) {
    return path == "/" || path.compare(0, std::string(FOLDER).size(), FOLDER) == 0;
}

Answer answer(const SessionList& sessions, const PageRequest& request) {
    Answer answer = find(sessions, request);
    for (const auto& [name, value] :
         {std::pair("Content-Security-Policy", POLICY),
          std::pair("X-Content-Type-Options", "nosniff"), std::pair("X-Frame-Options", "DENY"),
          std::pair("Referrer-Policy", "no-referrer"),
          std::pair("Cross-Origin-Resource-Policy", "same-origin"),
          std::pair("Cross-Origin-Opener-Policy", "same-origin"),
          std::pair("Cache-Control", "no-store")}) {
        answer.headers.emplace_back(name, value);
    }
    return answer;
}

}  // namespace Gateway::Page
