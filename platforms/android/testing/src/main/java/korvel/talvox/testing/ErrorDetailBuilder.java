package korvel.talvox.testing;

import java.util.Objects;
import korvel.talvox.ErrorDetail;
import korvel.talvox.RecorderState;
import korvel.talvox.TestKitAccess;
import org.jspecify.annotations.Nullable;

/** Builds an {@link ErrorDetail}; what is not set is not known. Not thread-safe. */
public final class ErrorDetailBuilder {
    private String reason = "";
    private @Nullable Integer httpStatus;
    private @Nullable Integer deviceError;
    private @Nullable RecorderState recorderState;

    /** Begins a detail of which nothing is known. */
    public ErrorDetailBuilder() {}

    /** Sets the reason. */
    public ErrorDetailBuilder reason(String value) {
        reason = Objects.requireNonNull(value, "value");
        return this;
    }

    /**
     * Sets the HTTP status of the gateway's answer.
     *
     * @param value from 100 to 599
     * @throws IllegalArgumentException if it is outside that range
     */
    public ErrorDetailBuilder httpStatus(int value) {
        if (value < 100 || value > 599) {
            throw new IllegalArgumentException("httpStatus must be from 100 to 599, not " + value);
        }
        httpStatus = value;
        return this;
    }

    /** Sets the number that the device recognizer reported. */
    public ErrorDetailBuilder deviceError(int value) {
        deviceError = value;
        return this;
    }

    /** Sets the state of the engine's recorder. */
    public ErrorDetailBuilder recorderState(RecorderState value) {
        recorderState = Objects.requireNonNull(value, "value");
        return this;
    }

    /** The detail. */
    public ErrorDetail build() {
        return TestKitAccess.makeErrorDetail(reason, httpStatus, deviceError, recorderState);
    }
}
