package korvel.talvox.util;

import android.os.Bundle;
import android.util.Log;
import java.io.File;
import java.util.Objects;
import java.util.concurrent.Executor;
import korvel.talvox.impl.CertificateFile;
import korvel.talvox.impl.NativeLibrary;
import org.jspecify.annotations.Nullable;

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

    /** The most talkative level of {@link #setLogLevel}. */
    public static final int LOG_LEVEL_MAX = 2;

    private static final String TAG = "Talvox";
    private static final long STORE_BYTES_LEAST = 4L << 10;
    private static final long STORE_BYTES_MOST = 1L << 30;
    private static final long STORE_AGE_S_LEAST = 60;
    private static final long STORE_AGE_S_MOST = 100L * 365 * 24 * 60 * 60;

    /** What the application wants to run when everything is delivered, on its executor. */
    private static volatile @Nullable Runnable delivered;

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
     * Trusts the certificate authorities of a file, and no others, for https connections that are
     * opened from now on, to the endpoint and to the gateway: as {@link
     * korvel.talvox.TalvoxEngine#setCertificateFile}, which an application with the usage log alone
     * need not load.
     *
     * @param file certificates in PEM form; null for the authorities of the system
     * @throws IllegalArgumentException if the file is missing, cannot be read, holds no certificate
     *     or a broken one; what was trusted before stays trusted
     */
    public static void setCertificateFile(@Nullable File file) {
        CertificateFile.use(file);
    }

    /**
     * How much of the usage log's and the network layer's own messages goes to Android's log, for the
     * whole process.
     *
     * @param level 0: nothing. 1, which it is at first: what is refused or fails. 2: every step as
     *     well, with the addresses of the requests, so with identifier and parameters
     * @throws IllegalArgumentException if it is out of range
     */
    public static void setLogLevel(int level) {
        checkRange("level", level, 0, LOG_LEVEL_MAX);
        setLogLevelInternal(level);
    }

    private static native void setLogLevelInternal(int level);

    /** How many records are not delivered yet, with the one that is being sent. */
    public static native long getPendingCount();

    /**
     * Sets what runs whenever the last pending record has been delivered, in place of what was set
     * before. Records may be pending again by then.
     *
     * @param callback runs on the executor, once for each such moment
     * @param executor one that runs it at once has it run on the engine's event thread: then it must
     *     not block at all. If it refuses by throwing, the call is lost, with a line in the log
     */
    public static void setDeliveredCallback(Runnable callback, Executor executor) {
        Objects.requireNonNull(callback, "callback");
        Objects.requireNonNull(executor, "executor");
        delivered = () -> executor.execute(callback);
        watchDeliveryInternal();
    }

    /** Takes back {@link #setDeliveredCallback}; one that is with its executor may still run. */
    public static void clearDeliveredCallback() {
        delivered = null;
    }

    private static native void watchDeliveryInternal();

    /** Called by native code on the event thread, under the event lock. */
    private static void onDelivered() {
        final Runnable call = delivered;
        if (call == null) {
            return;
        }
        try {
            call.run();
        } catch (RuntimeException refusal) {
            Log.w(TAG, "the executor refuses the callback of the usage log", refusal);
        }
    }

    /**
     * Adds an event to a session.
     *
     * @param parameters any values; their texts are sent
     */
    public static native void logEvent(String session, String name, Bundle parameters);

    /** Adds an error to a session; otherwise as {@link #logEvent}. */
    public static native void logError(String session, String name, Bundle parameters);
}
