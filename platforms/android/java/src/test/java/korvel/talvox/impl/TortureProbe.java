package korvel.talvox.impl;

/** The preloaded library that lets native calls fail, and the platform clock. */
final class TortureProbe {
    /** Kinds of calls, by their numbers in {@code tests/torture/inject/Inject.h}. */
    static final int MEMORY = 0;

    static final int THREADS = 1;
    static final int DESCRIPTORS = 2;
    static final int SOCKETS = 3;

    static {
        NativeLibrary.load();
        System.loadLibrary("TalvoxBundleProbe");
    }

    private TortureProbe() {}

    /** Restricts it to the engine's calls; stops the clock. Returns false where it is not there. */
    static native boolean prepare();

    /** Counts from now on; the call of this number, from 1, fails, and with {@code onward} all later. */
    static native void arm(int kind, long call, boolean onward);

    static native void disarm();

    /** Whether a call has failed since it was armed. */
    static native boolean hasFailed();

    /** Moves the clock, and waits until the event thread has done what there was. */
    static native void advanceMs(long milliseconds);
}
