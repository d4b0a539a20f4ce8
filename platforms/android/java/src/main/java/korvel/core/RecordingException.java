package korvel.core;

import java.io.IOException;

/** A recording that fails for a reason that has a {@link RecordingReport.State}. */
final class RecordingException extends IOException {
    private static final long serialVersionUID = 1;

    private final RecordingReport.State state;

    RecordingException(RecordingReport.State state, String message) {
        super(message);
        this.state = state;
    }

    RecordingException(RecordingReport.State state, String message, Throwable cause) {
        super(message, cause);
        this.state = state;
    }

    static RecordingReport.State getState(Exception failure) {
        return failure instanceof RecordingException
                ? ((RecordingException) failure).state
                : RecordingReport.State.FAILED;
    }
}
