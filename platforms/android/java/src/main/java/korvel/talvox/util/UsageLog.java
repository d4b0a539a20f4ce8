package korvel.talvox.util;

import android.os.Bundle;
import android.util.Log;
import java.util.Objects;
import java.util.concurrent.atomic.AtomicBoolean;
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
 * <p>Each event becomes one record. Records are kept until the endpoint has taken them: in memory, or
 * in a folder if {@link LogCollector#openStore(java.io.File)} names one.
 * Any thread may call any method; none waits for the network. One session of a name may be open at a
 * time.
 *
 * <p><b>The time of a record is not a date.</b> A record begins with {@code time=YEAR-MONTH-DAY
 * HOUR:MINUTE:SECOND}. What these fields count is the device's monotonic clock in nanoseconds since
 * the device was started, deep sleep left out, written as if it were seconds since 1970 in UTC; and
 * the year counts from 1900, the month from 0. So one nanosecond is one second of the text:
 * {@code time=114149-05-16 16:00:00} was logged an hour after the start. To read it, add 1900 to the
 * year and 1 to the month and take the seconds since 1970: that is the number of nanoseconds. Times
 * of one device between two starts can be compared with each other, nothing else; a stored record may
 * be of an earlier start than those that follow it. Where the date
 * matters, log it as a parameter, or let the endpoint note when a record arrives.
 */
public final class UsageLog implements AutoCloseable {
    private static final String TAG = "Talvox";

    /** The log says already that logging is off. */
    private static final AtomicBoolean SAID_OFF = new AtomicBoolean();

    private final String id;
    private final SafetyNet.Watch watch;
    private boolean closed;

    private UsageLog(String id) {
        this.id = id;
        watch = SafetyNet.watch(this, "a UsageLog", () -> LogCollector.stopLogSession(id));
    }

    /**
     * Opens the session {@code id}. While logging is off, nothing is opened or logged, also not when
     * it is switched on later; Android's log says so, once until logging has been on.
     */
    public static UsageLog open(String id) {
        LogCollector.startLogSession(Objects.requireNonNull(id, "id"));
        if (LogCollector.isLoggingEnabled()) {
            SAID_OFF.set(false);
        } else if (!SAID_OFF.getAndSet(true)) {
            Log.w(TAG, "usage logging is off: nothing is logged into the session " + id);
        }
        return new UsageLog(id);
    }

    /**
     * Logs an event.
     *
     * @param parameters any values; their texts are sent
     * @throws IllegalStateException if this is closed
     */
    public void event(String name, Bundle parameters) {
        Objects.requireNonNull(name, "name");
        Objects.requireNonNull(parameters, "parameters");
        checkOpen("event");
        LogCollector.logEvent(id, name, parameters);
    }

    /** Logs an event without parameters; otherwise as {@link #event(String, Bundle)}. */
    public void event(String name) {
        event(name, Bundle.EMPTY);
    }

    /** Logs an error; otherwise as {@link #event(String, Bundle)}. */
    public void error(String name, Bundle parameters) {
        Objects.requireNonNull(name, "name");
        Objects.requireNonNull(parameters, "parameters");
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
