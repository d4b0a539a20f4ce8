/**
 * @file
 * The canonical sessions: what an application does, and what it meets.
 */
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "inject/Inject.h"

namespace Torture {

/** One canonical session. Without further words: PCM in one request, answered with results. */
struct Plan {
    enum class Sound { PUSHED, FILE, SERVER };
    enum class Ending { ANSWER, STOP, CANCEL, CANCEL_SENDING, RELEASE, NO_VOICE };
    enum class Gateway { ANSWERS, FAILS_ONCE, REFUSES, SILENT };

    const char* name;
    const char* title; /**< in the document */
    bool chunked = false;
    bool speex = false;
    Ending ending = Ending::ANSWER;
    Gateway gateway = Gateway::ANSWERS;
    Sound sound = Sound::PUSHED;
    bool warm = false;        /**< the engine has served a session before */
    bool logs = false;        /**< three usage records are made and delivered */
    bool dumps = false;       /**< the sound goes into a file as well */
    bool tls = false;         /**< the gateway speaks TLS */
    bool named = false;       /**< the gateway's address has a name to look up */
    bool asksNetwork = false; /**< the engine asks the system which networks there are */
};

/** All of them, in the order of the document. */
const std::vector<Plan>& getPlans();

/** @return the index of a session, or -1 */
int findPlan(const std::string& name);

/** The name of a kind on the command line and in the document. */
const char* getName(Kind kind);

/** @return the kind of this name, or -1 */
int findKind(const std::string& name);

}  // namespace Torture
