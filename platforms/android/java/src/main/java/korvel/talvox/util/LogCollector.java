package korvel.talvox.util;

import android.os.Bundle;
import korvel.talvox.impl.NativeLibrary;

/**
 * Collects usage events and errors in named sessions and sends them to the log collection endpoint.
 * {@link UsageLog} is the more convenient form, and explains the records.
 *
 * <p>Any thread may call any method; none waits for the network. Events are dropped while logging is
 * off, which it is at first, and those of a session that is not open.
 */
public final class LogCollector {
    static {
        NativeLibrary.load();
    }

    private LogCollector() {}

    /**
     * Whether events are collected from now on. {@link korvel.talvox.TalvoxSettings#EVENTS_LOGGING},
     * where it is set on the engine, calls this; the later call decides. Open sessions stay open and
     * records that wait are sent, also while it is off.
     */
    public static native void setLoggingEnabled(boolean enabled);

    public static native boolean isLoggingEnabled();

    /** Opens the session {@code id}; nothing happens while logging is off. */
    public static native void startLogSession(String id);

    /**
     * Logs the end of the session {@code id} and closes it; what it has collected is still sent.
     * Nothing happens while logging is off.
     */
    public static native void stopLogSession(String id);

    /** Sets the identifier of this installation, which every record carries. */
    public static native void setUuid(String uuid);

    /**
     * Sets the identifier of this installation and the endpoint's address, to which {@code
     * ?uuid=...&logmessage=...} is appended. Neither is checked. Until this is called, the identifier
     * is empty and the address that of a development gateway on this machine, {@code
     * http://127.0.0.1:8090/log}: on a device, nothing arrives anywhere.
     */
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
