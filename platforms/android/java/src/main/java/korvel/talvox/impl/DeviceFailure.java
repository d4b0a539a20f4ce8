package korvel.talvox.impl;

import org.jspecify.annotations.Nullable;

/**
 * What the device recognizer reported, on its way to the session. Native code has room for the
 * engine's error alone, but calls the session on the thread that reports the failure, before that
 * call returns. So the failure waits on the thread for the session to take it.
 */
public final class DeviceFailure {
    private static final ThreadLocal<@Nullable DeviceFailure> REPORTED = new ThreadLocal<>();

    private final @Nullable Integer number;
    private final String reason;

    private DeviceFailure(@Nullable Integer number, String reason) {
        this.number = number;
        this.reason = reason;
    }

    /** An error of {@link android.speech.SpeechRecognizer}. */
    static DeviceFailure ofNumber(int number) {
        return new DeviceFailure(
                number, "the device recognizer reported " + PlatformErrors.describe(number));
    }

    /** A failure that the kit found by itself. */
    static DeviceFailure ofReason(String reason) {
        return new DeviceFailure(null, reason);
    }

    /** Runs a call of native code that ends the session with this failure. */
    void report(Runnable call) {
        REPORTED.set(this);
        try {
            call.run();
        } finally {
            REPORTED.remove();
        }
    }

    /**
     * The failure that this thread reports, once: what ends inside the same call, but later, has
     * other causes. Null if there is none.
     */
    public static @Nullable DeviceFailure take() {
        final DeviceFailure failure = REPORTED.get();
        REPORTED.remove();
        return failure;
    }

    /** The error number of the device recognizer; null if it has reported none. */
    public @Nullable Integer getNumber() {
        return number;
    }

    public String getReason() {
        return reason;
    }
}
