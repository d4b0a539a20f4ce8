package korvel.talvox.ktx

import korvel.talvox.Recognition

/**
 * An event of one recognition, in the order of [korvel.talvox.RecognitionListener]. The last event
 * is [Results]. A recognition that ends with an error has none: the flow throws a
 * [RecognitionException] instead.
 */
public sealed interface RecognitionEvent {
    /** The microphone is open: the user may speak. */
    public data object RecordingBegin : RecognitionEvent

    /** The user has begun to speak. */
    public data object SpeakingBegin : RecognitionEvent

    /** Listening is over; the answer is on its way. */
    public data object RecordingDone : RecognitionEvent

    /**
     * A buffer of the recorded sound. The device recognizer does not deliver any.
     *
     * @property pcm 100 ms of 16-bit little-endian mono at
     *   [korvel.talvox.TalvoxSettings.SAMPLE_RATE], owned by the collector
     */
    public class BufferReceived(public val pcm: ByteArray) : RecognitionEvent

    /**
     * The sound level has changed.
     *
     * @property level in decibels; the device recognizer has a scale of its own
     */
    public data class PowerChanged(public val level: Float) : RecognitionEvent

    /**
     * The recognition has ended with results.
     *
     * @property recognition the verdict and the hypotheses, of which there may be none
     */
    public data class Results(public val recognition: Recognition) : RecognitionEvent
}
