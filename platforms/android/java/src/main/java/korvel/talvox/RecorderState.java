package korvel.talvox;

import korvel.core.SessionRecording;
import org.jspecify.annotations.Nullable;

/** What the engine's recorder had reached in a session, or why it failed. */
public enum RecorderState {
    /** The microphone was being opened, or the recording before this one still held it. */
    OPENING(SessionRecording.State.OPENING),
    /** It recorded without a failure; where there was no speech, the room was quiet. */
    RECORDING(SessionRecording.State.RECORDING),
    /**
     * The system delivered silence in place of the microphone's sound: another application had
     * priority, this one was in the background, or the user has switched the microphone off. Android
     * says so from version 10 on; before, the state is {@link #ONLY_ZEROS}.
     */
    SILENCED(SessionRecording.State.SILENCED),
    /** The microphone delivered only zeros for more than a second, as a muted or broken one does. */
    ONLY_ZEROS(SessionRecording.State.ONLY_ZEROS),
    /** The sound came to its end, or the microphone delivers no more. */
    ENDED(SessionRecording.State.ENDED),
    /** The application lacks the permission RECORD_AUDIO, or lost it during the recording. */
    NO_PERMISSION(SessionRecording.State.NO_PERMISSION),
    /** The microphone could not be opened or started, or not at this sample rate. */
    UNAVAILABLE(SessionRecording.State.UNAVAILABLE),
    /** Another application was using the microphone. */
    IN_USE(SessionRecording.State.IN_USE),
    /** The microphone, or an input of the application's own, failed; the reason says how. */
    FAILED(SessionRecording.State.FAILED);

    private final SessionRecording.State reported;

    RecorderState(SessionRecording.State reported) {
        this.reported = reported;
    }

    /** Null for null. */
    static @Nullable RecorderState of(SessionRecording.@Nullable State reported) {
        for (RecorderState state : values()) {
            if (state.reported == reported) {
                return state;
            }
        }
        return null;
    }
}
