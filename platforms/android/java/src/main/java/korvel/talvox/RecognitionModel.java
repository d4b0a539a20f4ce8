package korvel.talvox;

/** What is spoken about. See {@link TalvoxSettings#MODEL}. */
public enum RecognitionModel implements SettingValue {
    /** Anything. */
    GENERAL("general"),
    /** Places and addresses. */
    MAPS("maps"),
    /** The gateway's model of this name. */
    MAPSKVRI("mapskvri"),
    /** The gateway's model of this name. */
    IRONLADY("ironlady");

    private final String text;

    RecognitionModel(String text) {
        this.text = text;
    }

    @Override
    public String getText() {
        return text;
    }
}
