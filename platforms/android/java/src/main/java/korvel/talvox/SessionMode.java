package korvel.talvox;

/** How the microphone is opened. See {@link TalvoxSettings#SESSION_MODE}. */
public enum SessionMode implements SettingValue {
    /** As for any recording. */
    GENERAL("general"),
    /** Tuned by the device for recognition. */
    VOICE_RECOGNITION("voice_recognition");

    private final String text;

    SessionMode(String text) {
        this.text = text;
    }

    @Override
    public String getText() {
        return text;
    }
}
