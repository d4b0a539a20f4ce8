package korvel.talvox;

/**
 * Hears of one recognition. Override what you need.
 *
 * <p>All methods are called on the executor given to {@link TalvoxEngine#createRecognizer} (the main
 * looper unless you say otherwise), one at a time and in order, and none after {@link
 * TalvoxRecognizer#close} has been called there. The last call is exactly one of {@link #onResults}
 * and {@link #onError(SpeechError, ErrorDetail)}.
 *
 * <p>May do: call any method of the recognizer and the engine, start the next recognition from
 * {@link #onResults} or {@link #onError(SpeechError, ErrorDetail)}. Must not: block the executor for
 * long. An exception thrown here is the executor's: on the main looper it ends the application as
 * any other does.
 */
public interface RecognitionListener {
    /** The microphone is open: the user may speak. */
    default void onRecordingBegin() {}

    /** The user has begun to speak. */
    default void onSpeakingBegin() {}

    /** Listening is over; the answer is on its way. */
    default void onRecordingDone() {}

    /**
     * A piece of the recorded sound. The device recognizer does not deliver any.
     *
     * @param pcm 16-bit little-endian mono at {@link TalvoxSettings#SAMPLE_RATE}, 100 ms; yours to
     *     keep
     */
    default void onBufferReceived(byte[] pcm) {}

    /**
     * The sound level has changed.
     *
     * @param level in decibels; the device recognizer has a scale of its own
     */
    default void onPowerChanged(float level) {}

    /** The recognition has ended with results. */
    default void onResults(Recognition recognition) {}

    /**
     * The recognition has ended without results. Override this one or {@link #onError(SpeechError)}:
     * the kit calls this one, which calls the other.
     *
     * @param detail what is known of the cause
     */
    default void onError(SpeechError error, ErrorDetail detail) {
        onError(error);
    }

    /** The recognition has ended without results, for listeners that do not need the detail. */
    default void onError(SpeechError error) {}
}
