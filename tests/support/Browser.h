/**
 * @file
 * A headless browser that a test looks through.
 */
#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "support/ChildProcess.h"

namespace TestSupport {

/**
 * One page in Chromium, steered over its DevTools pipe. Nothing here waits for a time: an
 * expression that waits for something gives a promise.
 */
class Browser {
  public:
    /** The program; a test without it skips. */
    static constexpr const char* PROGRAM = "chromium-headless-shell";

    /** Starts the browser. @param folder an empty folder for its files, which outlives it */
    explicit Browser(const std::string& folder);
    ~Browser();
    Browser(const Browser&) = delete;
    Browser& operator=(const Browser&) = delete;

    /** Opens an address and waits until it is loaded. */
    void open(const std::string& url);

    /**
     * Evaluates an expression in the page, and waits for it if it is a promise.
     * @return its value; "exception" with a text when it throws
     */
    nlohmann::json evaluate(const std::string& expression);

    /**
     * Waits until an expression is true, looking again after each change of the document.
     * @return its value
     */
    nlohmann::json waitFor(const std::string& expression);

    /** Writes a picture of the whole page. @param scheme "light" or "dark" */
    void photograph(const std::string& path, const std::string& scheme);

    /** Errors in the page so far: exceptions, messages on its console, what its policy refused. */
    std::vector<std::string> getComplaints();

  private:
    /** Sends a command and reads up to its answer. @return the result */
    nlohmann::json call(const std::string& method, const nlohmann::json& parameters = {});
    nlohmann::json readMessage();
    void note(const nlohmann::json& message);

    ChildProcess process;
    int commands = -1;
    int answers = -1;
    int lastId = 0;
    std::string session;
    std::string unread;
    bool isLoaded = false;
    std::vector<std::string> complaints;
};

}  // namespace TestSupport
