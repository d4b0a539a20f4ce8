package korvel.talvox.impl;

import korvel.core.CoreApplication;

/** Loads {@code libKorvelTalvox.so}, once per process. */
public final class NativeLibrary {
    static {
        System.loadLibrary("KorvelTalvox");
        CoreApplication.connect();
    }

    private NativeLibrary() {}

    /**
     * Returns when the library is loaded. Every class with native methods calls this from its
     * initialiser.
     *
     * @throws UnsatisfiedLinkError if the library is not among the application's libraries
     */
    public static void load() {
        // The static initialiser has done it.
    }
}
