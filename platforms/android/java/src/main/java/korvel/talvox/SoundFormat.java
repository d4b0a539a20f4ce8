package korvel.talvox;

/** The form in which sound is sent. See {@link TalvoxSettings#SOUND_FORMAT}. */
public enum SoundFormat implements SettingValue {
    /** Uncompressed. */
    PCM("pcm"),
    /** Uncompressed on Wi-Fi, else Ogg Speex. */
    PCM_IF_WIFI("pcm_if_wifi"),
    /** Ogg Speex. */
    SPEEX("speex");

    private final String text;

    SoundFormat(String text) {
        this.text = text;
    }

    @Override
    public String getText() {
        return text;
    }
}
