package korvel.talvox;

import java.util.Objects;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import org.jspecify.annotations.Nullable;

/**
 * What is known of the cause of an error, for developers: log it, count it, but do not show it to
 * users. A value that is not known, or that has no part in the error, is absent. Immutable.
 */
public final class ErrorDetail {
    /**
     * Native code has the status in its reason only. What follows a semicolon is the reason of an
     * attempt before the last one.
     */
    private static final Pattern HTTP_STATUS =
            Pattern.compile("^(?:[^;]*\\()?HTTP status (\\d{3})");

    private final String reason;
    private final @Nullable Integer httpStatus;
    private final @Nullable Integer deviceError;
    private final @Nullable RecorderState recorderState;

    ErrorDetail(
            String reason,
            @Nullable Integer httpStatus,
            @Nullable Integer deviceError,
            @Nullable RecorderState recorderState) {
        this.reason = reason;
        this.httpStatus = httpStatus;
        this.deviceError = deviceError;
        this.recorderState = recorderState;
    }

    /** The status of the gateway's answer that a reason of the network layer names; or null. */
    static @Nullable Integer findHttpStatus(String reason) {
        final Matcher matcher = HTTP_STATUS.matcher(reason);
        return matcher.find() ? Integer.valueOf(matcher.group(1)) : null;
    }

    /**
     * The cause in one line of English, such as "HTTP status 404", "could not connect to server" or
     * "the recorder failed: the application lacks the permission RECORD_AUDIO". The texts are not
     * fixed: do not let code depend on them.
     *
     * @return empty if the cause is not known
     */
    public String getReason() {
        return reason;
    }

    /** The HTTP status of the gateway's answer; null if the session ended without an answer. */
    public @Nullable Integer getHttpStatus() {
        return httpStatus;
    }

    /**
     * The number that the device recognizer reported, one of the {@code ERROR_} constants of {@link
     * android.speech.SpeechRecognizer}; null if the device recognizer did not serve, or reported no
     * number.
     */
    public @Nullable Integer getDeviceError() {
        return deviceError;
    }

    /**
     * What the engine's recorder had reached when the session ended or stopped it; null if the
     * session had no recorder. The device recognizer records by itself.
     */
    public @Nullable RecorderState getRecorderState() {
        return recorderState;
    }

    @Override
    public boolean equals(@Nullable Object other) {
        if (!(other instanceof ErrorDetail)) {
            return false;
        }
        final ErrorDetail that = (ErrorDetail) other;
        return reason.equals(that.reason)
                && Objects.equals(httpStatus, that.httpStatus)
                && Objects.equals(deviceError, that.deviceError)
                && recorderState == that.recorderState;
    }

    @Override
    public int hashCode() {
        return Objects.hash(reason, httpStatus, deviceError, recorderState);
    }

    /** All that is known, in one line for the log. */
    @Override
    public String toString() {
        return (reason.isEmpty() ? "unknown cause" : reason)
                + (httpStatus == null ? "" : ", HTTP status " + httpStatus)
                + (deviceError == null ? "" : ", device error " + deviceError)
                + (recorderState == null ? "" : ", recorder " + recorderState);
    }
}
