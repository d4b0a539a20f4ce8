#include <ostream>
#include <string>

#include "Plan.h"

namespace Lifecycle {

namespace {

const char* nameOf(GatewayBehaviour behaviour) {
    switch (behaviour) {
        case GatewayBehaviour::ANSWER:
            return "answers";
        case GatewayBehaviour::REFUSE_CONNECTION:
            return "refuses the connection";
        case GatewayBehaviour::RESET:
            return "resets";
        case GatewayBehaviour::RESET_AFTER_HEAD:
            return "resets after the head of the answer";
        case GatewayBehaviour::STALL:
            return "takes nothing";
        case GatewayBehaviour::SILENCE:
            return "never answers";
        case GatewayBehaviour::TOO_MUCH:
            return "answers too much";
    }
    return "?";
}

const char* nameOf(Reply reply) {
    switch (reply) {
        case Reply::WORDS:
            return "words";
        case Reply::NOTHING_UNDERSTOOD:
            return "nothing understood";
        case Reply::NO_HEADER:
            return "no header";
        case Reply::NOT_BASE64:
            return "not base64";
        case Reply::NOT_XML:
            return "not XML";
        case Reply::REFUSAL:
            return "404";
        case Reply::FAILURE:
            return "503";
        case Reply::FAILURE_WITH_WORDS:
            return "503 with words";
    }
    return "?";
}

std::string nameOfSession(int session) {
    if (session == NEWEST) {
        return "the newest";
    }
    return session == SELF ? "itself" : "session " + std::to_string(session);
}

void describe(const AttemptPlan& attempt, std::ostream& out) {
    out << "    gateway " << nameOf(attempt.behaviour) << " (" << nameOf(attempt.reply) << ")";
    if (attempt.afterBytes == AttemptPlan::WHOLE_BODY) {
        out << " after the whole body";
    } else {
        out << " after " << attempt.afterBytes << " bytes";
    }
    out << " and " << attempt.delayMs << " ms"
        << (attempt.pausesAfterHead ? ", the end apart from the head" : "") << "\n";
}

void describe(const DevicePlan& device, std::ostream& out) {
    out << "    is served by the platform" << (device.throwsWhenMade ? ", throws when made" : "")
        << (device.throwsAtStart ? ", throws at start" : "")
        << (device.throwsAtStop ? ", throws at stop" : "")
        << (device.throwsAtCancel ? ", throws at cancel" : "") << "; says inside start "
        << static_cast<int>(device.insideStart) << ", stop " << static_cast<int>(device.insideStop)
        << ", cancel " << static_cast<int>(device.insideCancel) << "; logging " << device.logging
        << "\n";
}

void describe(const SessionPlan& session, std::ostream& out) {
    if (session.kind == Kind::STAND_IN) {
        out << "    is served by the stand-in\n";
    } else if (session.kind == Kind::PLATFORM) {
        describe(session.device, out);
    }
    const RecorderPlan& recorder = session.recorder;
    if (recorder.refuses || recorder.failsAtStart || recorder.failsWhenStopped ||
        recorder.flushesWhenStopped) {
        out << "    recorder" << (recorder.refuses ? " refuses" : "")
            << (recorder.failsAtStart ? " fails-at-start" : "")
            << (recorder.failsWhenStopped ? " fails-when-stopped" : "")
            << (recorder.flushesWhenStopped ? " delivers-when-stopped" : "") << "\n";
    }
    for (const AttemptPlan& attempt : session.attempts) {
        describe(attempt, out);
    }
    for (const Reaction& reaction : session.reactions) {
        out << "    in " << Lifecycle::nameOf(reaction.event) << " number " << reaction.nth + 1
            << ": " << reaction << "\n";
    }
}

}  // namespace

const char* nameOf(Action action) {
    switch (action) {
        case Action::CREATE:
            return "create";
        case Action::CREATE_AND_START:
            return "create and start";
        case Action::START:
            return "start";
        case Action::STOP:
            return "stop";
        case Action::CANCEL:
            return "cancel";
        case Action::RELEASE:
            return "release";
        case Action::UPDATE_SETTINGS:
            return "update settings";
        case Action::CALL_GETTERS:
            return "call the getters";
        case Action::SOUND:
            return "sound";
        case Action::LONG_SOUND:
            return "long sound";
        case Action::WHOLE_SOUND:
            return "whole sound";
        case Action::ODD_SOUND:
            return "odd sound";
        case Action::RUDE_SOUND:
            return "rude sound";
        case Action::RECORDER_FAILS:
            return "the recorder fails";
        case Action::DEVICE_SAYS:
            return "the device says";
        case Action::WAIT:
            return "wait";
        case Action::JUMP:
            return "jump";
        case Action::CHANGE_REACHABILITY:
            return "change reachability";
    }
    return "?";
}

const char* nameOf(Event event) {
    static const char* const NAMES[] = {
        "recordingBegin", "speakingBegin", "recordingDone", "buffer", "power", "results", "error"};
    return NAMES[static_cast<int>(event)];
}

std::ostream& operator<<(std::ostream& out, const Step& step) {
    return out << nameOf(step.action) << " [" << step.amount << "] " << nameOfSession(step.session)
               << (step.joined ? ", joined to the next" : "")
               << (step.networkStands ? ", the network stands still" : "")
               << (step.answersFirst ? ", answers first" : "");
}

std::ostream& operator<<(std::ostream& out, const Reaction& reaction) {
    return out << nameOf(reaction.action) << " [" << reaction.amount << "] "
               << nameOfSession(reaction.session);
}

std::ostream& operator<<(std::ostream& out, const Sequence& sequence) {
    out << "seed " << sequence.seed << ", settings " << sequence.settings << "\n";
    for (std::size_t i = 0; i < sequence.sessions.size(); ++i) {
        out << "  session " << i << ":\n";
        describe(sequence.sessions[i], out);
    }
    for (std::size_t i = 0; i < sequence.steps.size(); ++i) {
        out << "  step " << i << ": " << sequence.steps[i] << "\n";
    }
    return out;
}

}  // namespace Lifecycle
