package korvel.talvox;

/** The application's choice of recognizer. See {@link TalvoxSettings#ASR_POLICY}. */
public enum AsrPolicy implements SettingValue {
    /** The gateway. */
    KORVEL_ONLY("korvel_only"),
    /** The device recognizer. */
    PLATFORM_ONLY("platform_only"),
    /** The device recognizer if there is one, else the gateway. */
    PLATFORM_FIRST("platform_first"),
    /** None: every recognition ends with {@link SpeechError#NOT_AVAILABLE}. */
    DISABLED("disabled");

    private final String text;

    AsrPolicy(String text) {
        this.text = text;
    }

    @Override
    public String getText() {
        return text;
    }
}
