package korvel.talvox.impl;

/** Counts broken invariants. */
public final class AssertionProbe {
    static {
        NativeLibrary.load();
        System.loadLibrary("TalvoxBundleProbe");
    }

    private AssertionProbe() {}

    /** Broken invariants that native code has reported since the process began. */
    public static native long count();
}
