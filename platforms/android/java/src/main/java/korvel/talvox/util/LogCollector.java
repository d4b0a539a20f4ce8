package korvel.talvox.util;

import android.os.Bundle;
import java.io.File;
import java.util.Objects;
import korvel.talvox.impl.NativeLibrary;

/**
 * Collects usage events and errors in named sessions and sends them to the log collection endpoint.
 * {@link UsageLog} is the more convenient form, and explains the records.
 *
 * <p>Any thread may call any method; none waits for the network. Events are dropped while logging is
 * off, which it is at first, and those of a session that is not open. Records live in memory unless
 * {@link #openStore(File)} gives them a folder.
 */
public final class LogCollector {
    /** How much a store may hold unless the application says otherwise: 4 MiB. */
    public static final long STORE_BYTES = 4L << 20;

    /** How long a store keeps a record unless the application says otherwise: 30 days. */
    public static final long STORE_AGE_S = 30L * 24 * 60 * 60;

    private static final long STORE_BYTES_LEAST = 4L << 10;
    private static final long STORE_BYTES_MOST = 1L << 30;
    private static final long STORE_AGE_S_LEAST = 60;
    private static final long STORE_AGE_S_MOST = 100L * 365 * 24 * 60 * 60;

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

    /** Whether events are collected. */
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
     * Keeps records in a folder until they are delivered, so that they outlive the process; with the
     * bounds {@link #STORE_BYTES} and {@link #STORE_AGE_S}. Otherwise as {@link #openStore(File,
     * long, long)}.
     */
    public static boolean openStore(File folder) {
        return openStore(folder, STORE_BYTES, STORE_AGE_S);
    }

    /**
     * Keeps records in a folder until they are delivered, so that they outlive the process. Call it
     * once, after {@link #configure}: what earlier processes left is sent at once and first, also
     * while logging is off. From then on a record is safe when the method that logs it returns; a
     * device that loses its power may lose the last seconds. A record may arrive twice for each end
     * of a process. Reads files, so call it on a thread that may.
     *
     * <p>When a bound is reached, the oldest records go, up to 1/16 of the bound at once, and a
     * record of the session {@code logStore}, type {@code error}, name {@code logRecordsDropped}, has
     * their number in its parameter {@code count}.
     *
     * @param folder a folder for the store alone, such as {@code new File(context.getFilesDir(),
     *     "usage")}; it is made if it is missing. One process can use it at a time: an application
     *     with several needs a folder for each
     * @param maxBytes how much the folder may hold, 4 KiB to 1 GiB
     * @param maxAgeS how long a record is kept, in seconds, from a minute to 100 years
     * @return false if records stay in memory only, as without this call; Android's log says why
     * @throws IllegalArgumentException if a bound is out of range
     */
    public static boolean openStore(File folder, long maxBytes, long maxAgeS) {
        Objects.requireNonNull(folder, "folder");
        checkRange("maxBytes", maxBytes, STORE_BYTES_LEAST, STORE_BYTES_MOST);
        checkRange("maxAgeS", maxAgeS, STORE_AGE_S_LEAST, STORE_AGE_S_MOST);
        return openStore(folder.getPath(), maxBytes, maxAgeS);
    }

    private static void checkRange(String name, long value, long least, long most) {
        if (value < least || value > most) {
            throw new IllegalArgumentException(
                    name + " is " + value + ", not " + least + " to " + most);
        }
    }

    private static native boolean openStore(String folder, long maxBytes, long maxAgeS);

    /**
     * Adds an event to a session.
     *
     * @param parameters any values; their texts are sent
     */
    public static native void logEvent(String session, String name, Bundle parameters);

    /** Adds an error to a session; otherwise as {@link #logEvent}. */
    public static native void logError(String session, String name, Bundle parameters);
}
