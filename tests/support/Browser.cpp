#include "support/Browser.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <fstream>
#include <stdexcept>

#include "core/util/Base64Coder.h"

namespace TestSupport {

namespace {

using Json = nlohmann::json;

/** Makes the two pipes by name, so that a shell can open them as the numbers that are expected. */
std::vector<std::string> makeCommand(const std::string& folder) {
    const std::string in = folder + "/commands";
    const std::string out = folder + "/answers";
    if (mkfifo(in.c_str(), 0600) != 0 || mkfifo(out.c_str(), 0600) != 0) {
        throw std::runtime_error("cannot make pipes in " + folder);
    }
    return {"sh",
            "-c",
            "exec \"$@\" 3<\"$0/commands\" 4>\"$0/answers\" >/dev/null 2>&1",
            folder,
            Browser::PROGRAM,
            "--no-sandbox",
            "--disable-gpu",
            "--autoplay-policy=no-user-gesture-required",
            "--remote-debugging-pipe",
            "--user-data-dir=" + folder + "/profile",
            "--window-size=1200,1000",
            "about:blank"};
}

}  // namespace

Browser::Browser(const std::string& folder)
    : process(makeCommand(folder), {{"HOME", folder}, {"TZ", "UTC"}}),
      commands(::open((folder + "/commands").c_str(), O_WRONLY | O_CLOEXEC)),
      answers(::open((folder + "/answers").c_str(), O_RDONLY | O_CLOEXEC)) {
    const Json target = call("Target.createTarget", {{"url", "about:blank"}});
    const Json attached =
        call("Target.attachToTarget", {{"targetId", target.at("targetId")}, {"flatten", true}});
    session = attached.at("sessionId");
    for (const char* domain : {"Page.enable", "Runtime.enable", "Log.enable"}) {
        call(domain);
    }
}

Browser::~Browser() {
    // Its children end when the pipe closes; only the browser itself would be killed.
    close(commands);
    close(answers);
    process.wait();
}

void Browser::open(const std::string& url) {
    isLoaded = false;
    call("Page.navigate", {{"url", url}});
    while (!isLoaded) {
        note(readMessage());
    }
}

Json Browser::evaluate(const std::string& expression) {
    const Json answer =
        call("Runtime.evaluate",
             {{"expression", expression}, {"awaitPromise", true}, {"returnByValue", true}});
    if (answer.contains("exceptionDetails")) {
        return {{"exception", answer["exceptionDetails"].dump()}};
    }
    return answer.at("result").value("value", Json());
}

Json Browser::waitFor(const std::string& expression) {
    return evaluate(
        "new Promise((resolve, reject) => {"
        "  const look = () => (" +
        expression +
        ");"
        "  const now = look();"
        "  if (now) { resolve(now); return; }"
        "  const observer = new MutationObserver(() => {"
        "    let value;"
        "    try { value = look(); } catch (failure) { observer.disconnect(); reject(failure); }"
        "    if (value) { observer.disconnect(); resolve(value); }"
        "  });"
        "  observer.observe(document, {subtree: true, childList: true, attributes: true,"
        "                              characterData: true});"
        "})");
}

void Browser::photograph(const std::string& path, const std::string& scheme) {
    call("Emulation.setEmulatedMedia",
         {{"features", Json::array({{{"name", "prefers-color-scheme"}, {"value", scheme}}})}});
    const Json picture =
        call("Page.captureScreenshot", {{"format", "png"}, {"captureBeyondViewport", true}});
    std::vector<unsigned char> bytes;
    Util::Base64Coder::decode(picture.at("data").get<std::string>(), bytes);
    std::ofstream file(path, std::ios::binary);
    file.write(reinterpret_cast<const char*>(bytes.data()),
               static_cast<std::streamsize>(bytes.size()));
}

std::vector<std::string> Browser::getComplaints() {
    // Messages come in order: all that the page has said so far is in front of this answer.
    evaluate("0");
    return complaints;
}

Json Browser::call(const std::string& method, const Json& parameters) {
    Json command = {{"id", ++lastId},
                    {"method", method},
                    {"params", parameters.is_null() ? Json::object() : parameters}};
    if (!session.empty()) {
        command["sessionId"] = session;
    }
    const std::string text = command.dump() + '\0';
    std::size_t done = 0;
    while (done < text.size()) {
        const ssize_t count = ::write(commands, text.data() + done, text.size() - done);
        if (count <= 0) {
            throw std::runtime_error("the browser takes no command");
        }
        done += static_cast<std::size_t>(count);
    }
    while (true) {
        const Json message = readMessage();
        if (message.value("id", 0) == lastId) {
            if (message.contains("error")) {
                throw std::runtime_error(method + ": " + message["error"].dump());
            }
            return message.at("result");
        }
        note(message);
    }
}

Json Browser::readMessage() {
    std::size_t end = unread.find('\0');
    while (end == std::string::npos) {
        std::array<char, 65536> bytes;
        const ssize_t count = ::read(answers, bytes.data(), bytes.size());
        if (count <= 0) {
            throw std::runtime_error("the browser has ended");
        }
        unread.append(bytes.data(), static_cast<std::size_t>(count));
        end = unread.find('\0');
    }
    Json message = Json::parse(unread.substr(0, end));
    unread.erase(0, end + 1);
    return message;
}

void Browser::note(const Json& message) {
    const std::string method = message.value("method", "");
    if (method == "Page.loadEventFired") {
        isLoaded = true;
    }
    const bool isError =
        method == "Runtime.exceptionThrown" ||
        (method == "Log.entryAdded" && message["params"]["entry"]["level"] == "error") ||
        (method == "Runtime.consoleAPICalled" && message["params"]["type"] == "error");
    if (isError) {
        complaints.push_back(message["params"].dump());
    }
}

}  // namespace TestSupport
