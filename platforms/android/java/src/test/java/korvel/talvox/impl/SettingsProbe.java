package korvel.talvox.impl;

/** Shows and changes what of the engine's settings no Java call reaches. */
public final class SettingsProbe {
    static {
        NativeLibrary.load();
        System.loadLibrary("TalvoxBundleProbe");
    }

    private SettingsProbe() {}

    /** Adds a key to the engine's settings that their table does not have. */
    static native void addUnknownSetting();

    /** Gives the engine its default settings. */
    static native void restoreDefaults();

    /** The keys whose value counts on the engine only, for the cloud recognizer at least. */
    public static native String[] engineKeys();

    /** The keys that may have a value of their own for one recognition. */
    public static native String[] recognitionKeys();
}
