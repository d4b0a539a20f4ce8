package korvel.talvox;

/**
 * Why a recognition ended without results. The device recognizer, Android's own, reports errors of
 * its own choice; the cloud recognizer uses all but {@link #SERVER}.
 */
public enum SpeechError {
    /**
     * The engine got no thread, or memory ran out, also for the results of either recognizer. The
     * device recognizer: it failed without a cause that has a value here.
     */
    UNKNOWN("ErrorUnknown"),
    /**
     * The microphone could not be opened, may not be used, failed or delivered too little, or the
     * recognition was stopped before any sound; the log says which.
     */
    AUDIO("ErrorAudio"),
    /** There was no memory or thread for the Speex encoder. */
    ENCODING("ErrorEncoding"),
    /**
     * Everything between the engine and results: no network at the start, no address or identifier
     * configured, no connection, no answer within 20 s, and every answer without readable results,
     * whatever its HTTP status. The device recognizer: network errors, and no callback of it within
     * its time limits.
     */
    NETWORK("ErrorNetwork"),
    /** The service of the device recognizer failed. Failures of the gateway are NETWORK. */
    SERVER("ErrorServer"),
    /** {@link TalvoxRecognizer#cancel} was called. */
    CANCELED("ErrorCanceled"),
    /** No speech within 5 s of the start. The device recognizer: its own limit. */
    NO_VOICE("ErrorNoVoice"),
    /**
     * Recognition is not available with these settings on this device. The device recognizer: it
     * could not be started, or it does not have the language.
     */
    NOT_AVAILABLE("ErrorNotAvailable"),
    /**
     * Another recognition is running, or this one was started a second time. The device recognizer:
     * it is in use elsewhere.
     */
    BUSY("ErrorBusy");

    private final String text;

    SpeechError(String text) {
        this.text = text;
    }

    /** The number by which native code knows this error. */
    public int getCode() {
        return ordinal();
    }

    /** The engine's name of this error, as its log has it, for example "ErrorNoVoice". */
    public String getText() {
        return text;
    }

    /** The error of a native code; {@link #UNKNOWN} for numbers outside the table. */
    static SpeechError fromCode(int code) {
        final SpeechError[] all = values();
        return code >= 0 && code < all.length ? all[code] : UNKNOWN;
    }
}
