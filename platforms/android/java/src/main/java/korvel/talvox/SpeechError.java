package korvel.talvox;

/** Why a recognition ended without results. */
public enum SpeechError {
    /** Nothing more is known. */
    UNKNOWN("ErrorUnknown"),
    /** The microphone failed or may not be used; the log says which. */
    AUDIO("ErrorAudio"),
    /** The sound could not be encoded. */
    ENCODING("ErrorEncoding"),
    /** No network, no answer in time, or no address and identifier configured. */
    NETWORK("ErrorNetwork"),
    /** The service answered with an error. */
    SERVER("ErrorServer"),
    /** {@link TalvoxRecognizer#cancel} was called. */
    CANCELED("ErrorCanceled"),
    /** Nobody spoke within the time limit. */
    NO_VOICE("ErrorNoVoice"),
    /** Recognition is not available with these settings on this device. */
    NOT_AVAILABLE("ErrorNotAvailable"),
    /** Another recognition is running. */
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
