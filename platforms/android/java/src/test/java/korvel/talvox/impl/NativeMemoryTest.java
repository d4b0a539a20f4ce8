package korvel.talvox.impl;

import android.location.Location;
import android.os.Bundle;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.ResidentMemory;
import org.junit.Test;

/** What crosses the border leaves nothing behind. */
public class NativeMemoryTest extends EngineTestCase {
    private static final int WARM_UP = 10_000;
    private static final int CONVERSIONS = 100_000;
    private static final long KIB_ALLOWED = 4 * 1024;

    /** An entry of every type. */
    private static Bundle makeBundle() {
        final Bundle bundle = new Bundle();
        bundle.putString("language", "язык😀\0");
        bundle.putBoolean("streaming", true);
        bundle.putInt("verbosity", 0);
        bundle.putFloat("upperconfidence", 0.5f);
        final Location location = new Location("test");
        location.setLatitude(10.5);
        bundle.putParcelable("myll", location);
        return bundle;
    }

    private static void convert(Bundle bundle, int times) {
        for (int index = 0; index < times; index++) {
            Talvox.updateSettings(Talvox.getHandle(), bundle);
            if (index % 100 == 0) {
                Talvox.getSettings(Talvox.getHandle());
            }
        }
    }

    @Test
    public void aHundredThousandConversionsLeaveNothing() throws Exception {
        final Bundle bundle = makeBundle();
        convert(bundle, WARM_UP);
        // 40 bytes for each conversion: less than a text or an element that is lost.
        ResidentMemory.assertDoesNotGrow(KIB_ALLOWED, () -> convert(bundle, CONVERSIONS));
    }
}
