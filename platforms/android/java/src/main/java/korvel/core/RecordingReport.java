package korvel.core;

import java.util.function.Supplier;
import org.jspecify.annotations.Nullable;

/**
 * What has become of the recording of one session. The recorder writes it before native code
 * receives the same news; any thread may read it.
 *
 * <p>Native code makes the recorder inside the start of a session, on the same thread. So a session
 * installs its report on that thread while it starts, and the recorder takes it from there.
 */
public final class RecordingReport {
    /** What a recorder has reached, or why it has failed. */
    public enum State {
        OPENING,
        RECORDING,
        ENDED,
        NO_PERMISSION,
        UNAVAILABLE,
        IN_USE,
        FAILED
    }

    private static final ThreadLocal<@Nullable RecordingReport> STARTING = new ThreadLocal<>();

    private volatile @Nullable State state;
    private volatile String failure = "";

    /** Runs {@code start} with this report for the recorder that is made inside. */
    public <T> T during(Supplier<T> start) {
        final RecordingReport outer = STARTING.get();
        STARTING.set(this);
        try {
            return start.get();
        } finally {
            STARTING.set(outer);
        }
    }

    /** The report of the session that this thread starts; a new one if it starts none. */
    static RecordingReport ofStart() {
        final RecordingReport report = STARTING.get();
        return report != null ? report : new RecordingReport();
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
