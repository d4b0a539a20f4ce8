package korvel.talvox;

/** A value that the engine knows by a text. */
interface SettingValue {
    String getText();
}
