#include <array>
#include <initializer_list>

#include "Plan.h"

namespace Lifecycle {

namespace {

/** Reproducible on every machine, unlike the standard library's distributions. */
class Dice {
  public:
    explicit Dice(std::uint64_t seed) : state(seed * 0x9E3779B97F4A7C15U + 0x2545F4914F6CDD1DU) {}

    /** 0 to `count` - 1. */
    int pick(int count) {
        state += 0x9E3779B97F4A7C15U;
        std::uint64_t mixed = state;
        mixed = (mixed ^ (mixed >> 30)) * 0xBF58476D1CE4E5B9U;
        mixed = (mixed ^ (mixed >> 27)) * 0x94D049BB133111EBU;
        mixed ^= mixed >> 31;
        return static_cast<int>(mixed % static_cast<std::uint64_t>(count));
    }

    bool oneIn(int count) { return pick(count) == 0; }

    template <typename Value>
    Value of(std::initializer_list<Value> values) {
        return values.begin()[pick(static_cast<int>(values.size()))];
    }

  private:
    std::uint64_t state;
};

/** About the limits of 2 s (retry), 5 s (no voice), 10 s (no sound), 20 s (sound, answer), 30 s. */
int pickTimeMs(Dice& dice) {
    return dice.of({0,     1,     99,    100,   250,   700,   1000,  1999,  2000,
                    2001,  4899,  4999,  5000,  5001,  7000,  9999,  10000, 10001,
                    15000, 19999, 20000, 20001, 25000, 30000, 30001, 60000});
}

AttemptPlan makeAttempt(Dice& dice) {
    AttemptPlan attempt;
    if (!dice.oneIn(3)) {
        attempt.behaviour = static_cast<GatewayBehaviour>(dice.pick(BEHAVIOUR_COUNT));
    }
    if (!dice.oneIn(3)) {
        attempt.reply = static_cast<Reply>(dice.pick(REPLY_COUNT));
    }
    if (dice.oneIn(3)) {
        attempt.afterBytes = static_cast<std::size_t>(dice.of({0, 1, 200, 700, 800, 900, 1500}));
    }
    if (dice.oneIn(3)) {
        attempt.delayMs = pickTimeMs(dice);
    }
    attempt.pausesAfterHead = dice.oneIn(3);
    return attempt;
}

Reaction makeReaction(Dice& dice) {
    Reaction reaction;
    reaction.event = static_cast<Event>(dice.pick(EVENT_COUNT));
    reaction.nth = dice.oneIn(3) ? dice.pick(6) : 0;
    reaction.action = static_cast<Action>(dice.pick(LISTENER_ACTION_COUNT));
    reaction.session = dice.oneIn(4) ? NEWEST : SELF;
    reaction.amount = dice.pick(SETTINGS_COUNT);
    return reaction;
}

Saying pickSaying(Dice& dice) {
    return static_cast<Saying>(dice.pick(SAYING_COUNT));
}

DevicePlan makeDevice(Dice& dice) {
    DevicePlan device;
    device.throwsWhenMade = dice.oneIn(20);
    device.throwsAtStart = dice.oneIn(20);
    device.throwsAtStop = dice.oneIn(20);
    device.throwsAtCancel = dice.oneIn(20);
    device.insideStart = dice.oneIn(8) ? pickSaying(dice) : Saying::NOTHING;
    device.insideStop = dice.oneIn(4) ? pickSaying(dice) : Saying::NOTHING;
    device.insideCancel = dice.oneIn(4) ? pickSaying(dice) : Saying::NOTHING;
    device.logging = dice.pick(8);
    return device;
}

SessionPlan makeSession(Dice& dice) {
    SessionPlan session;
    session.kind = dice.of({Kind::CLOUD, Kind::CLOUD, Kind::CLOUD, Kind::CLOUD, Kind::CLOUD,
                            Kind::CLOUD, Kind::CLOUD, Kind::CLOUD, Kind::CLOUD, Kind::CLOUD,
                            Kind::PLATFORM, Kind::PLATFORM, Kind::STAND_IN});
    session.device = makeDevice(dice);
    session.recorder.refuses = dice.oneIn(40);
    session.recorder.failsAtStart = dice.oneIn(40);
    session.recorder.failsWhenStopped = dice.oneIn(30);
    session.recorder.flushesWhenStopped = dice.oneIn(30);
    for (int left = dice.pick(4); left > 0; --left) {
        session.attempts.push_back(makeAttempt(dice));
    }
    for (int left = dice.oneIn(2) ? 0 : 1 + dice.pick(4); left > 0; --left) {
        session.reactions.push_back(makeReaction(dice));
    }
    return session;
}

class StepMaker {
  public:
    StepMaker(Dice& source, const std::vector<SessionPlan>& plans)
        : dice(source), sessions(plans) {}

    std::vector<Step> make() {
        const std::size_t wanted = 5 + static_cast<std::size_t>(dice.pick(20));
        while (steps.size() < wanted) {
            if (dice.oneIn(3)) {
                addAnything();
            } else {
                addSession();
            }
        }
        return steps;
    }

  private:
    void add(Action action, int amount = 0, int session = NEWEST) {
        Step step;
        step.action = action;
        step.session = session;
        step.amount = amount;
        step.joined = dice.oneIn(12);
        step.networkStands = dice.oneIn(10);
        step.answersFirst = dice.oneIn(4);
        steps.push_back(step);
    }

    void addAnything() {
        const auto action = static_cast<Action>(dice.pick(ACTION_COUNT));
        add(action, pickAmount(action),
            dice.oneIn(2) ? NEWEST : dice.pick(static_cast<int>(MOST_SESSIONS)));
    }

    int pickAmount(Action action) {
        switch (action) {
            case Action::SOUND:
                return 1 + dice.pick(12);
            case Action::LONG_SOUND:
                return 1 + dice.pick(24);
            case Action::WHOLE_SOUND:
                return 1 + dice.pick(2);
            case Action::ODD_SOUND:
                return dice.pick(ODD_SOUND_COUNT);
            case Action::DEVICE_SAYS:
                return dice.pick(SAYING_COUNT);
            case Action::WAIT:
            case Action::JUMP:
                return pickTimeMs(dice);
            case Action::CHANGE_REACHABILITY:
                return dice.oneIn(4) ? 0 : 1 + dice.pick(2);
            default:
                return dice.pick(SETTINGS_COUNT);
        }
    }

    /** What a session is made for, with a disturbance here and there. */
    void addSession() {
        if (dice.oneIn(3)) {
            add(Action::UPDATE_SETTINGS, dice.pick(SETTINGS_COUNT));
        }
        add(Action::CREATE_AND_START);
        disturb();
        // Roughly: listeners create sessions as well.
        if (created < sessions.size() && sessions[created++].kind == Kind::PLATFORM) {
            addDevice();
            return;
        }
        add(Action::SOUND, 3);
        disturb();
        if (dice.oneIn(4)) {
            add(Action::LONG_SOUND, 3 + dice.pick(20));
        } else {
            add(Action::SOUND, 1 + dice.pick(9));
        }
        disturb();
        if (!dice.oneIn(4)) {
            add(dice.oneIn(8) ? Action::CANCEL : Action::STOP);
            disturb();
        }
        add(Action::WAIT, pickTimeMs(dice));
        if (dice.oneIn(2)) {
            add(Action::WAIT, pickTimeMs(dice));
        }
    }

    /** What a device says, in good order. */
    void addDevice() {
        for (const Saying saying : {Saying::READY, Saying::BEGINNING, Saying::SOUND, Saying::LEVEL,
                                    Saying::END, Saying::RESULTS}) {
            if (!dice.oneIn(6)) {
                add(Action::DEVICE_SAYS, static_cast<int>(saying));
                disturb();
            }
        }
    }

    void disturb() {
        if (dice.oneIn(5)) {
            addAnything();
        }
    }

    Dice& dice;
    const std::vector<SessionPlan>& sessions;
    std::size_t created = 0;
    std::vector<Step> steps;
};

}  // namespace

Sequence makeSequence(std::uint64_t seed) {
    Dice dice(seed);
    Sequence sequence;
    sequence.seed = seed;
    sequence.settings = dice.pick(SETTINGS_COUNT);
    for (std::size_t i = 0; i < MOST_SESSIONS; ++i) {
        sequence.sessions.push_back(makeSession(dice));
    }
    sequence.steps = StepMaker(dice, sequence.sessions).make();
    return sequence;
}

}  // namespace Lifecycle
