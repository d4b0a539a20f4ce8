package korvel.core;

import java.io.IOException;

/** A recording that fails for a reason that has a {@link SessionRecording.State}. */
final class RecordingException extends IOException {
    private static final long serialVersionUID = 1;

    private final SessionRecording.State state;

    RecordingException(SessionRecording.State state, String message) {
        super(message);
        this.state = state;
    }

    RecordingException(SessionRecording.State state, String message, Throwable cause) {
        super(message, cause);
        this.state = state;
    }

    static SessionRecording.State getState(Throwable failure) {
        return failure instanceof RecordingException
                ? ((RecordingException) failure).state
                : SessionRecording.State.FAILED;
    }
}
