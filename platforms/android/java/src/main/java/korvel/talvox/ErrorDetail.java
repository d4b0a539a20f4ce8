package korvel.talvox;

import java.util.Objects;
import org.jspecify.annotations.Nullable;

/**
 * What is known of the cause of an error, for developers: log it, count it, but do not show it to
 * users. A value that is not known, or that has no part in the error, is absent. Immutable.
 */
public final class ErrorDetail {
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
