package korvel.talvox.testing;

import java.io.File;
import java.util.ArrayDeque;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Objects;
import java.util.Queue;
import java.util.TreeSet;
import java.util.concurrent.Executor;
import korvel.talvox.ErrorDetail;
import korvel.talvox.RecordingOptions;
import korvel.talvox.SettingKey;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.TestKitAccess;
import korvel.talvox.impl.EngineBackend;
import org.jspecify.annotations.Nullable;

/**
 * An engine for an application's own tests: sessions follow scripts, on a clock that the test moves.
 * It needs no native library, no device and no network. Engine, recognizers and settings are the
 * kit's own classes, with all their rules; only what lies below them is replaced.
 *
 * <pre>{@code
 * try (FakeEngine fake = new FakeEngine()) {
 *     fake.play(Script.cloud().after(300).recordingBegin().after(200).speakingBegin()
 *             .after(900).recordingDone().after(100)
 *             .results(RecognitionBuilder.accepted("go forward")).build());
 *     Dictation dictation = new Dictation(fake.getEngine());
 *     dictation.listen();
 *     fake.advanceBy(1500);
 *     assertEquals("go forward", dictation.getText());
 * }
 * }</pre>
 *
 * <p>The contract is that of the engine:
 *
 * <ul>
 *   <li>one session runs at a time; the start of a second one ends it with {@link SpeechError#BUSY};
 *   <li>{@code stop} reports the end of listening before it returns. The scripted end follows as long
 *       after that as the script has it after its own end of listening; one that the script has
 *       while listening follows at the next step of the clock, {@link SpeechError#NO_VOICE} as empty
 *       results. Within 100 ms of the start there is no sound yet: {@link SpeechError#AUDIO};
 *   <li>{@code cancel} ends the session with {@link SpeechError#CANCELED}, {@code close} silently;
 *   <li>a listener without an executor of its own is called inside {@link #advanceBy}, on the thread
 *       that calls it, never inside {@code start}, {@code stop} or {@code cancel}.
 * </ul>
 *
 * <p>Not replaced: the usage log and the gestures of the proximity sensor, which need the native
 * library. Any thread may call the engine; the test moves the clock on one thread.
 */
public final class FakeEngine implements AutoCloseable {
    private static final long FIRST_SOUND_MS = 100;

    private final Backend backend = new Backend();
    private final TalvoxEngine engine = TestKitAccess.makeEngine(backend);
    private final Queue<Script> scripts = new ArrayDeque<>();
    private final Queue<Runnable> mainTasks = new ArrayDeque<>();
    private final TreeSet<String> languages = new TreeSet<>();
    private TalvoxSettings settings = TalvoxSettings.builder().build();
    private @Nullable TalvoxSettings sessionSettings;
    private @Nullable RecordingOptions sessionRecording;
    private final List<String> documents = new ArrayList<>();
    private boolean isRecognitionAvailable = true;
    private boolean isAdvancing;
    private @Nullable Session running;
    private int startCount;
    private long nowMs;

    /** An engine without settings, scripts and languages, with its clock at 0. */
    public FakeEngine() {}

    /** What the application uses. */
    public TalvoxEngine getEngine() {
        return engine;
    }

    /**
     * Lets {@link TalvoxEngine#getInstance} return this engine until it is closed, for applications
     * that ask for the engine themselves.
     */
    public FakeEngine install() {
        TestKitAccess.substitute(engine);
        return this;
    }

    /** Takes back {@link #install}. A running session gets no further event. */
    @Override
    public void close() {
        TestKitAccess.substitute(null);
        synchronized (this) {
            running = null;
            mainTasks.clear();
        }
    }

    /**
     * Adds a script for one session, after those that have been added. A session that starts without
     * a script throws an {@code AssertionError}.
     */
    public synchronized FakeEngine play(Script script) {
        scripts.add(Objects.requireNonNull(script, "script"));
        return this;
    }

    /** Sets the languages of {@link TalvoxEngine#getAvailableLanguages}. */
    public synchronized void setAvailableLanguages(String... tags) {
        final List<String> wanted = Arrays.asList(Objects.requireNonNull(tags, "tags"));
        for (String tag : wanted) {
            Objects.requireNonNull(tag, "tags");
        }
        languages.clear();
        languages.addAll(wanted);
    }

    /** Sets the answer of {@link TalvoxEngine#isRecognitionAvailable}, true unless set. */
    public synchronized void setRecognitionAvailable(boolean value) {
        isRecognitionAvailable = value;
    }

    /** The time of the clock in milliseconds. */
    public synchronized long getTimeMs() {
        return nowMs;
    }

    /** Whether a session has started and not ended. */
    public synchronized boolean isRunning() {
        return running != null;
    }

    /** How many sessions have started, those included that were refused as busy. */
    public synchronized int getStartCount() {
        return startCount;
    }

    /** The settings of the newest session, without those of the engine; null before the first. */
    public synchronized @Nullable TalvoxSettings getSessionSettings() {
        return sessionSettings;
    }

    /**
     * What the newest session would record from; null before the first. An input of the application's
     * own is not opened.
     */
    public synchronized @Nullable RecordingOptions getSessionRecording() {
        return sessionRecording;
    }

    /** The documents given to {@link TalvoxEngine#updateSettingsFromXml}, which change no setting. */
    public synchronized List<String> getXmlDocuments() {
        return new ArrayList<>(documents);
    }

    /**
     * Moves the clock and delivers what is due, each event at its own time. 0 delivers what the
     * application's calls have caused.
     *
     * @param durationMs 0 or more
     * @throws IllegalArgumentException if it is less than 0
     * @throws IllegalStateException if a listener calls this from inside an event
     */
    public void advanceBy(long durationMs) {
        if (durationMs < 0) {
            throw new IllegalArgumentException("time does not run back: " + durationMs);
        }
        final long target;
        synchronized (this) {
            if (isAdvancing) {
                throw new IllegalStateException("advanceBy: called from inside an event");
            }
            isAdvancing = true;
            target = Math.addExact(nowMs, durationMs);
        }
        try {
            do {
                runMainTasks();
            } while (step(target));
        } finally {
            synchronized (this) {
                isAdvancing = false;
            }
        }
    }

    /** Moves the clock to the end of the running session, if there is one, and delivers all of it. */
    public void finish() {
        final long restMs;
        synchronized (this) {
            restMs = running == null ? 0 : running.getEndMs() - nowMs;
        }
        advanceBy(restMs);
    }

    /** Delivers the next event that is due by then; moves the clock on and returns false without. */
    private synchronized boolean step(long targetMs) {
        if (running == null || running.getNextMs() > targetMs) {
            nowMs = targetMs;
            return !mainTasks.isEmpty();
        }
        nowMs = Math.max(nowMs, running.getNextMs());
        running.deliverNext();
        return true;
    }

    private void runMainTasks() {
        while (true) {
            final Runnable task;
            synchronized (this) {
                task = mainTasks.poll();
            }
            if (task == null) {
                return;
            }
            task.run();
        }
    }

    private synchronized EngineBackend.Running start(
            TalvoxSettings values, RecordingOptions recording, EngineBackend.Events listener) {
        startCount++;
        sessionSettings = values;
        sessionRecording = recording;
        if (running != null) {
            listener.onError(SpeechError.BUSY, reason("another session is active"));
            return new Refused();
        }
        final Script script = scripts.poll();
        if (script == null) {
            throw new AssertionError("no script is left for session " + startCount);
        }
        final Session session = new Session(script, listener);
        running = session;
        while (session.isRunning() && session.getNextMs() <= nowMs) {
            session.deliverNext();
        }
        return session;
    }

    private static TalvoxSettings merge(TalvoxSettings older, TalvoxSettings newer) {
        final TalvoxSettings.Builder merged = older.toBuilder();
        for (SettingKey<?> key : TalvoxSettings.keys()) {
            copy(newer, key, merged);
        }
        return merged.build();
    }

    private static <T> void copy(
            TalvoxSettings from, SettingKey<T> key, TalvoxSettings.Builder to) {
        final T value = from.get(key);
        if (value != null) {
            to.set(key, value);
        }
    }

    private static ErrorDetail reason(String text) {
        return new ErrorDetailBuilder().reason(text).build();
    }

    /** One session. Used under the engine's monitor, as the real one under the event lock. */
    private final class Session implements EngineBackend.Running {
        private final EngineBackend.Events listener;
        private final long startMs = nowMs;
        private final ArrayDeque<Script.Event> rest;
        private final Script script;
        private boolean isListeningOver;

        /** When the next event comes, against its time in the script. */
        private long shiftMs = nowMs;

        Session(Script script, EngineBackend.Events listener) {
            this.script = script;
            this.listener = listener;
            this.rest = new ArrayDeque<>(script.getEvents());
        }

        boolean isRunning() {
            return running == this;
        }

        long getNextMs() {
            return rest.element().timeMs + shiftMs;
        }

        long getEndMs() {
            return script.getEnd().timeMs + shiftMs;
        }

        void deliverNext() {
            final Script.Event event = rest.remove();
            if (event.kind == Script.Kind.RECORDING_DONE) {
                isListeningOver = true;
            }
            if (event.kind == Script.Kind.END) {
                running = null;
            }
            event.deliver(listener);
        }

        @Override
        public void stop() {
            synchronized (FakeEngine.this) {
                if (!isRunning() || isListeningOver) {
                    return;
                }
                isListeningOver = true;
                if (nowMs - startMs < FIRST_SOUND_MS) {
                    fail(SpeechError.AUDIO, "no sound was recorded");
                    return;
                }
                listener.onRecordingDone();
                if (isRunning()) {
                    answer();
                }
            }
        }

        /** Leaves of the script its end, at its distance from the end of listening. */
        private void answer() {
            rest.clear();
            rest.add(script.getEndAfterStop());
            shiftMs = nowMs - script.getStopMs();
        }

        @Override
        public void cancel() {
            synchronized (FakeEngine.this) {
                if (isRunning()) {
                    fail(SpeechError.CANCELED, "the application cancelled");
                }
            }
        }

        private void fail(SpeechError error, String why) {
            running = null;
            listener.onError(error, reason(why));
        }

        @Override
        public void close() {
            synchronized (FakeEngine.this) {
                if (isRunning()) {
                    running = null;
                }
            }
        }
    }

    /** A session that ended inside its start. */
    private static final class Refused implements EngineBackend.Running {
        @Override
        public void stop() {}

        @Override
        public void cancel() {}

        @Override
        public void close() {}
    }

    /** What lies below the kit's classes. */
    private final class Backend implements EngineBackend {
        @Override
        public String getVersion() {
            return "fake";
        }

        @Override
        public TalvoxSettings getSettings() {
            synchronized (FakeEngine.this) {
                return settings;
            }
        }

        @Override
        public void updateSettings(TalvoxSettings changes) {
            synchronized (FakeEngine.this) {
                settings = merge(settings, changes);
            }
        }

        @Override
        public void updateSettingsFromXml(String xml) {
            synchronized (FakeEngine.this) {
                documents.add(xml);
            }
        }

        @Override
        public void setCertificateFile(@Nullable File file) {}

        @Override
        public boolean isRecognitionAvailable(TalvoxSettings ignored) {
            synchronized (FakeEngine.this) {
                return isRecognitionAvailable;
            }
        }

        @Override
        public List<String> getAvailableLanguages() {
            synchronized (FakeEngine.this) {
                return new ArrayList<>(languages);
            }
        }

        @Override
        public Executor getMainExecutor() {
            return task -> {
                synchronized (FakeEngine.this) {
                    mainTasks.add(task);
                }
            };
        }

        @Override
        public Running start(
                TalvoxSettings values, RecordingOptions recording, Events listener) {
            return FakeEngine.this.start(values, recording, listener);
        }
    }
}
