package korvel.talvox;

/** Whether usage events are collected. See {@link TalvoxSettings#EVENTS_LOGGING}. */
public enum EventsLogging implements SettingValue {
    /** They are. */
    ENABLED("enabled"),
    /** They are not. */
    DISABLED("disabled");

    private final String text;

    EventsLogging(String text) {
        this.text = text;
    }

    @Override
    public String getText() {
        return text;
    }
}
