package korvel.talvox.impl;

/** Brings the engine into states that no Java call can, and counts broken invariants. */
final class AssertionProbe {
    static {
        NativeLibrary.load();
        System.loadLibrary("TalvoxBundleProbe");
    }

    private AssertionProbe() {}

    /** Adds a key to the engine's settings that their table does not have. */
    static native void addUnknownSetting();

    /** Gives the engine its default settings. */
    static native void restoreDefaults();

    /** Broken invariants that native code has reported since the process began. */
    static native long count();
}
