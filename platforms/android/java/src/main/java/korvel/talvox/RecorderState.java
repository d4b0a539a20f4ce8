package korvel.talvox;

import korvel.core.RecordingReport;
import org.jspecify.annotations.Nullable;

/** What the engine's recorder had reached in a session, or why it failed. */
public enum RecorderState {
    /** The microphone was being opened, or the recording before this one still held it. */
    OPENING(RecordingReport.State.OPENING),
    /** It recorded without a failure. */
    RECORDING(RecordingReport.State.RECORDING),
    /** The sound came to its end, or the microphone delivers no more. */
    ENDED(RecordingReport.State.ENDED),
    /** The application lacks the permission RECORD_AUDIO. */
    NO_PERMISSION(RecordingReport.State.NO_PERMISSION),
    /** The microphone could not be opened or started, or not at this sample rate. */
    UNAVAILABLE(RecordingReport.State.UNAVAILABLE),
    /** Another application was using the microphone. */
    IN_USE(RecordingReport.State.IN_USE),
    /** The microphone, or an input of the application's own, failed; the reason says how. */
    FAILED(RecordingReport.State.FAILED);

    private final RecordingReport.State reported;

    RecorderState(RecordingReport.State reported) {
        this.reported = reported;
    }

    /** Null for null. */
    static @Nullable RecorderState of(RecordingReport.@Nullable State reported) {
        for (RecorderState state : values()) {
            if (state.reported == reported) {
                return state;
            }
        }
        return null;
    }
}
