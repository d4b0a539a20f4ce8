package korvel.core;

import java.util.function.Supplier;
import org.jspecify.annotations.Nullable;

/**
 * The recording of one session: what it records from, and what has become of it. The recorder writes
 * the latter before native code receives the same news; any thread may read it.
 *
 * <p>Native code makes the recorder inside the start of a session, on the same thread. So a session
 * installs this on that thread while it starts, and the recorder takes it from there.
 */
public final class SessionRecording {
    /** What a recorder has reached, or why it has failed. */
    public enum State {
        OPENING,
        RECORDING,
        SILENCED,
        ONLY_ZEROS,
        ENDED,
        NO_PERMISSION,
        UNAVAILABLE,
        IN_USE,
        FAILED
    }

    private static final ThreadLocal<@Nullable SessionRecording> STARTING = new ThreadLocal<>();

    private final SoundInput.@Nullable Factory inputs;
    private volatile @Nullable State state;
    private volatile String failure = "";

    /**
     * @param inputs opens what this session records from; null for what the others record from
     */
    public SessionRecording(SoundInput.@Nullable Factory inputs) {
        this.inputs = inputs;
    }

    /** Runs {@code start} with this for the recorder that is made inside. */
    public <T> T during(Supplier<T> start) {
        final SessionRecording outer = STARTING.get();
        STARTING.set(this);
        try {
            return start.get();
        } finally {
            STARTING.set(outer);
        }
    }

    /** The recording of the session that this thread starts; a new one if it starts none. */
    static SessionRecording ofStart() {
        final SessionRecording recording = STARTING.get();
        return recording != null ? recording : new SessionRecording(null);
    }

    SoundInput.@Nullable Factory getInputs() {
        return inputs;
    }

    void reach(State reached) {
        state = reached;
    }

    void fail(State how, String why) {
        failure = why;
        state = how;
    }

    /** Null if there has been no recorder. */
    public @Nullable State getState() {
        return state;
    }

    /** Why the recorder failed; empty if it has not. */
    public String getFailure() {
        return failure;
    }
}
