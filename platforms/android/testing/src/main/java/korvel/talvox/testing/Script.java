package korvel.talvox.testing;

import java.util.ArrayList;
import java.util.Collections;
import java.util.EnumSet;
import java.util.List;
import java.util.Objects;
import java.util.Set;
import korvel.talvox.ErrorDetail;
import korvel.talvox.Recognition;
import korvel.talvox.SpeechError;
import korvel.talvox.impl.EngineBackend;
import org.jspecify.annotations.Nullable;

/**
 * What happens in one session of a {@link FakeEngine}, in milliseconds of its clock since the start.
 * Immutable; may serve several sessions.
 *
 * <pre>{@code
 * Script script = Script.cloud()
 *         .after(300).recordingBegin()
 *         .after(500).speakingBegin()
 *         .after(100).level(45)
 *         .after(900).recordingDone()
 *         .after(200).results(RecognitionBuilder.accepted("go forward"))
 *         .build();
 * }</pre>
 *
 * <p>The builder keeps the engine's contract. It refuses, with an {@code IllegalStateException}, an
 * event that cannot come at that place or at that time: a second one of its kind, one before the one
 * that it follows, one after the end, one after a time limit of the engine. A script without an end
 * ends by that time limit, as a session does.
 */
public final class Script {
    private static final long NO_VOICE_MS = 5000;
    private static final long SOUND_MS = 20100;
    private static final long ANSWER_MS = 20000;
    private static final long DEVICE_SILENCE_MS = 30000;

    private static final Set<SpeechError> OF_CLOUD =
            EnumSet.of(
                    SpeechError.UNKNOWN,
                    SpeechError.AUDIO,
                    SpeechError.ENCODING,
                    SpeechError.NETWORK,
                    SpeechError.NO_VOICE);
    private static final Set<SpeechError> OF_DEVICE =
            EnumSet.of(
                    SpeechError.UNKNOWN,
                    SpeechError.AUDIO,
                    SpeechError.NETWORK,
                    SpeechError.SERVER,
                    SpeechError.NO_VOICE,
                    SpeechError.NOT_AVAILABLE,
                    SpeechError.BUSY);

    /** The kinds of events, in the order in which the cloud recognizer reports them. */
    enum Kind {
        RECORDING_BEGIN,
        SPEAKING_BEGIN,
        LEVEL,
        BUFFER,
        RECORDING_DONE,
        END
    }

    /** One event. */
    static final class Event {
        final long timeMs;
        final Kind kind;
        private final String name;
        private final Action action;

        Event(long timeMs, Kind kind, String name, Action action) {
            this.timeMs = timeMs;
            this.kind = kind;
            this.name = name;
            this.action = action;
        }

        void deliver(EngineBackend.Events listener) {
            action.deliver(listener);
        }

        @Override
        public String toString() {
            return name + " at " + timeMs + " ms";
        }
    }

    /** Calls the method of an event. */
    private interface Action {
        void deliver(EngineBackend.Events listener);
    }

    private final List<Event> events;
    private final Event endAfterStop;

    private Script(List<Event> events, Event endAfterStop) {
        this.events = Collections.unmodifiableList(new ArrayList<>(events));
        this.endAfterStop = endAfterStop;
    }

    /** A session of the cloud recognizer. */
    public static Builder cloud() {
        return new Builder(true);
    }

    /**
     * A session of the device recognizer, which reports no buffers, has errors and time limits of its
     * own, and chooses the order of its events.
     */
    public static Builder device() {
        return new Builder(false);
    }

    /** In their order, the last of them the end. */
    List<Event> getEvents() {
        return events;
    }

    Event getEnd() {
        return events.get(events.size() - 1);
    }

    /** What ends the session after a stop. */
    Event getEndAfterStop() {
        return endAfterStop;
    }

    /** The time in the script from which the end after a stop counts. */
    long getStopMs() {
        final Event done = find(events, Kind.RECORDING_DONE);
        return done != null ? done.timeMs : getEnd().timeMs;
    }

    private static @Nullable Event find(List<Event> events, Kind kind) {
        for (Event event : events) {
            if (event.kind == kind) {
                return event;
            }
        }
        return null;
    }

    /** Collects the events of a script. Not thread-safe. */
    public static final class Builder {
        private final boolean isCloud;
        private final List<Event> events = new ArrayList<>();
        private long nowMs;
        private boolean isNoVoice;

        private Builder(boolean isCloud) {
            this.isCloud = isCloud;
        }

        /**
         * Lets time pass before the next event.
         *
         * @param durationMs 0 or more
         * @throws IllegalArgumentException if it is less than 0
         */
        public Builder after(long durationMs) {
            if (durationMs < 0) {
                throw new IllegalArgumentException("time does not run back: " + durationMs);
            }
            nowMs = Math.addExact(nowMs, durationMs);
            return this;
        }

        /** The user may speak. */
        public Builder recordingBegin() {
            return addOnce(
                    Kind.RECORDING_BEGIN,
                    "onRecordingBegin",
                    EngineBackend.Events::onRecordingBegin);
        }

        /** The user begins to speak. */
        public Builder speakingBegin() {
            requireInCloud(Kind.RECORDING_BEGIN, "onSpeakingBegin", "before onRecordingBegin");
            return addOnce(
                    Kind.SPEAKING_BEGIN, "onSpeakingBegin", EngineBackend.Events::onSpeakingBegin);
        }

        /**
         * The sound level changes.
         *
         * @param level in decibels
         */
        public Builder level(float level) {
            requireListening("onPowerChanged");
            return add(Kind.LEVEL, "onPowerChanged", events -> events.onPowerChanged(level));
        }

        /**
         * A buffer of sound.
         *
         * @param pcm 16-bit mono; each session gets a copy
         * @throws IllegalStateException also in a session of the device recognizer
         */
        public Builder buffer(byte[] pcm) {
            final byte[] sound = Objects.requireNonNull(pcm, "pcm").clone();
            if (!isCloud) {
                throw new IllegalStateException(
                        "onBufferReceived: the device recognizer does not deliver sound");
            }
            requireListening("onBufferReceived");
            return add(
                    Kind.BUFFER,
                    "onBufferReceived",
                    events -> events.onBufferReceived(sound.clone()));
        }

        /** Listening ends by itself. {@code stop} ends it earlier. */
        public Builder recordingDone() {
            requireInCloud(Kind.SPEAKING_BEGIN, "onRecordingDone", "before onSpeakingBegin");
            return addOnce(
                    Kind.RECORDING_DONE, "onRecordingDone", EngineBackend.Events::onRecordingDone);
        }

        /**
         * The session ends with results.
         *
         * @throws IllegalStateException also if the device recognizer would give an identifier of a
         *     request
         */
        public Builder results(Recognition recognition) {
            Objects.requireNonNull(recognition, "recognition");
            if (!isCloud && !recognition.getRequestId().isEmpty()) {
                throw new IllegalStateException(
                        "onResults: the device recognizer has no identifier of a request");
            }
            return add(Kind.END, "onResults", events -> events.onResults(recognition));
        }

        /** The session ends with an error of which no detail is known. */
        public Builder error(SpeechError error) {
            return error(error, new ErrorDetailBuilder().build());
        }

        /**
         * The session ends with an error.
         *
         * @throws IllegalStateException also if this recognizer never reports that error, or that
         *     detail. {@link SpeechError#CANCELED} comes from {@code cancel} alone, and {@link
         *     SpeechError#BUSY} from the start of a second session
         */
        public Builder error(SpeechError error, ErrorDetail detail) {
            Objects.requireNonNull(error, "error");
            Objects.requireNonNull(detail, "detail");
            final String name = "onError " + error;
            if (!(isCloud ? OF_CLOUD : OF_DEVICE).contains(error)) {
                throw new IllegalStateException(
                        name + ": " + recognizer() + " does not report this error by itself");
            }
            checkDetail(name, error, detail);
            if (isCloud && error == SpeechError.NO_VOICE && has(Kind.SPEAKING_BEGIN)) {
                throw new IllegalStateException(name + ": after onSpeakingBegin");
            }
            add(Kind.END, name, events -> events.onError(error, detail));
            isNoVoice = error == SpeechError.NO_VOICE;
            return this;
        }

        private void checkDetail(String name, SpeechError error, ErrorDetail detail) {
            final boolean isForeign =
                    isCloud
                            ? detail.getDeviceError() != null
                            : detail.getHttpStatus() != null || detail.getRecorderState() != null;
            if (isForeign) {
                throw new IllegalStateException(
                        name + ": " + recognizer() + " does not know: " + detail);
            }
            if (detail.getHttpStatus() != null && error != SpeechError.NETWORK) {
                throw new IllegalStateException(
                        name + ": only NETWORK has an HTTP status: " + detail);
            }
        }

        /** The script; one without an end gets that of the engine's time limits. */
        public Script build() {
            final Builder whole = new Builder(isCloud);
            whole.events.addAll(events);
            whole.isNoVoice = isNoVoice;
            while (!whole.has(Kind.END)) {
                whole.addLimit();
            }
            return new Script(whole.events, whole.getEndAfterStop());
        }

        /** The end of this whole script, but an answer where it waits for speech in vain. */
        private Event getEndAfterStop() {
            final Event end = events.get(events.size() - 1);
            return isCloud && isNoVoice
                    ? new Event(
                            end.timeMs,
                            Kind.END,
                            "onResults",
                            events -> events.onResults(RecognitionBuilder.empty()))
                    : end;
        }

        /** What the engine does when nothing happens any more. */
        private void addLimit() {
            nowMs = getDeadlineMs();
            if (isCloud && !has(Kind.SPEAKING_BEGIN)) {
                error(SpeechError.NO_VOICE, reason("no speech within 5 s"));
            } else if (isCloud && !has(Kind.RECORDING_DONE)) {
                recordingDone();
            } else {
                error(
                        SpeechError.NETWORK,
                        reason(
                                isCloud
                                        ? "no answer within 20 s"
                                        : "no callback of the device recognizer"));
            }
        }

        private static ErrorDetail reason(String text) {
            return new ErrorDetailBuilder().reason(text).build();
        }

        /** When the engine itself acts if nothing more happens. */
        private long getDeadlineMs() {
            final Event done = find(events, Kind.RECORDING_DONE);
            if (done != null) {
                return done.timeMs + ANSWER_MS;
            }
            if (isCloud) {
                return has(Kind.SPEAKING_BEGIN) ? SOUND_MS : NO_VOICE_MS;
            }
            return DEVICE_SILENCE_MS
                    + (events.isEmpty() ? 0 : events.get(events.size() - 1).timeMs);
        }

        private String recognizer() {
            return isCloud ? "the cloud recognizer" : "the device recognizer";
        }

        private boolean has(Kind kind) {
            return find(events, kind) != null;
        }

        private void requireInCloud(Kind earlier, String name, String complaint) {
            if (isCloud && !has(Kind.END) && !has(earlier)) {
                throw new IllegalStateException(name + ": " + complaint);
            }
        }

        private void requireListening(String name) {
            requireInCloud(Kind.RECORDING_BEGIN, name, "before onRecordingBegin");
            if (isCloud && !has(Kind.END) && has(Kind.RECORDING_DONE)) {
                throw new IllegalStateException(name + ": after onRecordingDone");
            }
        }

        private Builder addOnce(Kind kind, String name, Action action) {
            if (has(kind)) {
                throw new IllegalStateException(name + ": a second time");
            }
            if (has(Kind.RECORDING_DONE) && isCloud) {
                throw new IllegalStateException(name + ": after onRecordingDone");
            }
            return add(kind, name, action);
        }

        private Builder add(Kind kind, String name, Action action) {
            final Event end = find(events, Kind.END);
            if (end != null) {
                throw new IllegalStateException(name + ": the session has ended, " + end);
            }
            if (nowMs > getDeadlineMs()) {
                throw new IllegalStateException(
                        name
                                + " at "
                                + nowMs
                                + " ms: the engine's time limit is "
                                + getDeadlineMs()
                                + " ms");
            }
            events.add(new Event(nowMs, kind, name, action));
            return this;
        }
    }
}
