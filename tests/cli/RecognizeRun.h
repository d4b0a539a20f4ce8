#pragma once

#include <string>
#include <vector>

#include "support/ScriptedHttpServer.h"

namespace TestSupport {

/** Parameters with which the detector needs a few buffers only: sound plays at its own pace. */
extern const char* const QUICK_VAD;
extern const char* const UUID;

/** An answer with these variants of the result document. */
Answer resultAnswer(const std::string& variants);

/** Raw sound for standard input that the detector takes for speech. */
std::string voice();

/** The arguments of a recognition of `voice` with more behind them. */
std::vector<std::string> recognize(const std::string& url, const std::vector<std::string>& more);

std::vector<std::string> lines(const std::string& text);

}  // namespace TestSupport
