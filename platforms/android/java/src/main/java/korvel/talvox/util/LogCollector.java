package korvel.talvox.util;

import android.os.Bundle;
import korvel.talvox.impl.NativeLibrary;

/**
 * Collects usage events and errors in named sessions and sends them to the log collection endpoint.
 *
 * <p>Any thread may call any method; none waits for the network. Events are dropped while logging is
 * disabled, and those of a session that is not open.
 */
public final class LogCollector {
    static {
        NativeLibrary.load();
    }

    private LogCollector() {}

    /** Whether events are collected from now on. */
    public static native void setLoggingEnabled(boolean enabled);

    public static native boolean isLoggingEnabled();

    /** Opens the session {@code id}. */
    public static native void startLogSession(String id);

    /** Closes the session {@code id}; what it has collected is still sent. */
    public static native void stopLogSession(String id);

    /** Sets the identifier of this installation, which every record carries. */
    public static native void setUuid(String uuid);

    /** Sets the identifier of this installation and the endpoint's address. */
    public static native void configure(String uuid, String url);

    /**
     * Adds an event to a session.
     *
     * @param parameters any values; their texts are sent
     */
    public static native void logEvent(String session, String name, Bundle parameters);

    /** Adds an error to a session; otherwise as {@link #logEvent}. */
    public static native void logError(String session, String name, Bundle parameters);
}
