package korvel.talvox.util;

import android.os.Bundle;
import java.util.Objects;
import korvel.talvox.impl.SafetyNet;

/**
 * One session of the usage log: open it, log into it, close it.
 *
 * <pre>{@code
 * LogCollector.configure(installationId, "https://log.example.org/log");
 * LogCollector.setLoggingEnabled(true);
 * try (UsageLog log = UsageLog.open("tour")) {
 *     log.event("page", parameters);
 * }
 * }</pre>
 *
 * <p>Records are kept in memory until the endpoint has taken them. Any thread may call any method;
 * none waits for the network. One session of a name may be open at a time.
 */
public final class UsageLog implements AutoCloseable {
    private final String id;
    private final SafetyNet.Watch watch;
    private boolean closed;

    private UsageLog(String id) {
        this.id = id;
        watch = SafetyNet.watch(this, "a UsageLog", () -> LogCollector.stopLogSession(id));
    }

    /** Opens the session {@code id}. While logging is disabled, nothing is opened or logged. */
    public static UsageLog open(String id) {
        LogCollector.startLogSession(Objects.requireNonNull(id, "id"));
        return new UsageLog(id);
    }

    /**
     * Logs an event.
     *
     * @param parameters any values; their texts are sent
     * @throws IllegalStateException if this is closed
     */
    public void event(String name, Bundle parameters) {
        checkOpen("event");
        LogCollector.logEvent(id, name, parameters);
    }

    /** Logs an event without parameters; otherwise as {@link #event(String, Bundle)}. */
    public void event(String name) {
        event(name, Bundle.EMPTY);
    }

    /** Logs an error; otherwise as {@link #event(String, Bundle)}. */
    public void error(String name, Bundle parameters) {
        checkOpen("error");
        LogCollector.logError(id, name, parameters);
    }

    /** Logs an error without parameters; otherwise as {@link #event(String, Bundle)}. */
    public void error(String name) {
        error(name, Bundle.EMPTY);
    }

    /** Logs the end of the session and closes it; what was logged is still sent. */
    @Override
    public void close() {
        synchronized (this) {
            if (closed) {
                return;
            }
            closed = true;
        }
        watch.end();
        LogCollector.stopLogSession(id);
    }

    private synchronized void checkOpen(String operation) {
        if (closed) {
            throw new IllegalStateException(operation + ": the usage log is closed");
        }
    }
}
