package korvel.talvox.impl;

import android.os.Bundle;

/**
 * The conversion of bundles by a table that has every type and nested bundles to any depth. The
 * base, where there is one, has three levels.
 */
final class BundleProbe {
    static {
        NativeLibrary.load();
        System.loadLibrary("TalvoxBundleProbe");
    }

    private BundleProbe() {}

    /** The base as it is. */
    static native Bundle makeBase();

    /** What a native copy of the base is after the update. */
    static native Bundle update(Bundle update);

    /** The XML text of what an empty native bundle is after the update. */
    static native String updateNothing(Bundle update);

    /** The same by a table without rows. */
    static native String updateWithoutTable(Bundle update);

    /** The XML text of the base after a copy of it was updated. */
    static native String getBaseAfter(Bundle update);

    /** How many of the base's two nested bundles the updated copy shares with it. */
    static native int countShared(Bundle update);

    /**
     * A native bundle whose nested one has a text of these bytes, an element of the unknown type 42
     * and a null bundle.
     */
    static native Bundle makeNested(byte[] title);
}
