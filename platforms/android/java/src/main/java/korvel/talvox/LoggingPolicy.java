package korvel.talvox;

/** Whether recognitions by the device are copied to the gateway. See {@link TalvoxSettings#LOGGING}. */
public enum LoggingPolicy implements SettingValue {
    /** Hypotheses and sound. */
    WITH_SOUND_ALWAYS("with_sound_always"),
    /** Hypotheses, and the sound on Wi-Fi. */
    WITH_SOUND_IF_WIFI("with_sound_if_wifi"),
    /** Hypotheses only. */
    WITHOUT_SOUND_ALWAYS("without_sound_always"),
    /** Nothing. */
    DISABLED("disabled");

    private final String text;

    LoggingPolicy(String text) {
        this.text = text;
    }

    @Override
    public String getText() {
        return text;
    }
}
