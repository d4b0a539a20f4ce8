/**
 * @file
 * A sequence of random steps: everything that happens in it is written down before it is run.
 */
#pragma once

#include <cstddef>
#include <cstdint>
#include <iosfwd>
#include <string>
#include <vector>

namespace Lifecycle {

/** What a listener hears. */
enum class Event { RECORDING_BEGIN, SPEAKING_BEGIN, RECORDING_DONE, BUFFER, POWER, RESULTS, ERROR };
constexpr int EVENT_COUNT = 7;

/** What happens from outside; a listener may do those before `SOUND` as well. */
enum class Action {
    CREATE,
    CREATE_AND_START,
    START,
    STOP,
    CANCEL,
    RELEASE,
    UPDATE_SETTINGS,
    CALL_GETTERS,
    SOUND,              /**< so many buffers of 100 ms, one at a time */
    LONG_SOUND,         /**< so many buffers of a second */
    WHOLE_SOUND,        /**< so many buffers with all their samples */
    ODD_SOUND,          /**< one buffer; the amount says what is odd about it */
    RUDE_SOUND,         /**< one buffer, whether the recorder was stopped or not */
    RECORDER_FAILS,     /**< an error in mid-session, or after it */
    DEVICE_SAYS,        /**< a `Saying` of the device recognizer */
    WAIT,               /**< so many ms, in which everything else goes on */
    JUMP,               /**< so many ms at once: timers run, nothing else does */
    CHANGE_REACHABILITY /**< to the amount */
};
constexpr int LISTENER_ACTION_COUNT = static_cast<int>(Action::SOUND);
constexpr int ACTION_COUNT = static_cast<int>(Action::CHANGE_REACHABILITY) + 1;
constexpr int ODD_SOUND_COUNT = 8;

/** Whose session an action is for. */
constexpr int NEWEST = -1;
constexpr int SELF = -2; /**< in a reaction: the one that calls */

struct Step {
    Action action = Action::WAIT;
    int session = NEWEST; /**< counted from 0 in the order of creation */
    int amount = 0;
    bool joined = false;        /**< the next step comes before anything asynchronous can happen */
    bool networkStands = false; /**< the network thread does nothing after this step */
    bool answersFirst = false;  /**< what the peers do comes before the network thread's commands */
};

/** What a listener does when it hears an event for the nth time. */
struct Reaction {
    Event event = Event::RECORDING_BEGIN;
    int nth = 0;
    Action action = Action::STOP;
    int session = SELF;
    int amount = 0;
};

struct RecorderPlan {
    bool refuses = false; /**< `init` fails */
    bool failsAtStart = false;
    bool failsWhenStopped = false;
    bool flushesWhenStopped = false; /**< delivers one more buffer from inside `stopRecording` */
};

/** What the gateway says. */
enum class Reply {
    WORDS,
    NOTHING_UNDERSTOOD,
    NO_HEADER,
    NOT_BASE64,
    NOT_XML,
    REFUSAL,           /**< 4xx */
    FAILURE,           /**< 5xx */
    FAILURE_WITH_WORDS /**< 5xx, and yet the header */
};
constexpr int REPLY_COUNT = 8;

/** What the gateway does with one attempt. */
enum class GatewayBehaviour {
    ANSWER,
    REFUSE_CONNECTION,
    RESET, /**< as soon as the bytes are there, without a word */
    RESET_AFTER_HEAD /**< between the head of the answer and its end */,
    STALL,   /**< takes nothing and says nothing */
    SILENCE, /**< takes everything and says nothing */
    TOO_MUCH /**< an answer with a body beyond every bound */
};
constexpr int BEHAVIOUR_COUNT = 7;

struct AttemptPlan {
    static constexpr std::size_t WHOLE_BODY = SIZE_MAX;

    GatewayBehaviour behaviour = GatewayBehaviour::ANSWER;
    Reply reply = Reply::WORDS;
    std::size_t afterBytes = WHOLE_BODY; /**< of the body, before anything is done */
    int delayMs = 0;                     /**< and then so long */
    bool pausesAfterHead = false;        /**< the end of the answer comes a turn later */
};

/** What the device recognizer tells the platform recognizer. */
enum class Saying {
    NOTHING,
    READY,
    BEGINNING,
    LEVEL,
    SOUND,
    END,
    PARTIAL,
    RESULTS,
    NO_HYPOTHESIS,
    ERROR,
    OTHER /**< an event that means nothing to the recognizer */
};
constexpr int SAYING_COUNT = 11;

struct DevicePlan {
    bool throwsWhenMade = false;
    bool throwsAtStart = false;
    bool throwsAtStop = false;
    bool throwsAtCancel = false;
    Saying insideStart = Saying::NOTHING; /**< what it says before the call returns */
    Saying insideStop = Saying::NOTHING;
    Saying insideCancel = Saying::NOTHING;
    int logging = 0; /**< which policy of uploads, see `Testbed` */
};

/** What serves a session, by its policy. */
enum class Kind { CLOUD, STAND_IN, PLATFORM };

struct SessionPlan {
    Kind kind = Kind::CLOUD;
    RecorderPlan recorder;
    DevicePlan device;
    std::vector<AttemptPlan> attempts; /**< those beyond are answered at once */
    std::vector<Reaction> reactions;
};

struct Sequence {
    std::uint64_t seed = 0;
    int settings = 0; /**< those of the beginning; an index, see `Testbed` */
    std::vector<SessionPlan> sessions;
    std::vector<Step> steps;
};

constexpr std::size_t MOST_SESSIONS = 8;
constexpr int SETTINGS_COUNT = 24;

/** The same sequence for the same seed, everywhere. */
Sequence makeSequence(std::uint64_t seed);

/** For people. */
std::ostream& operator<<(std::ostream& out, const Step& step);
std::ostream& operator<<(std::ostream& out, const Reaction& reaction);
std::ostream& operator<<(std::ostream& out, const Sequence& sequence);
const char* nameOf(Event event);
const char* nameOf(Action action);

}  // namespace Lifecycle
