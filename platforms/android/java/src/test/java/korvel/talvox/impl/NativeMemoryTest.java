package korvel.talvox.impl;

import static org.junit.Assert.assertTrue;

import android.location.Location;
import android.os.Bundle;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Paths;
import korvel.talvox.support.EngineTestCase;
import org.junit.Test;

/** What crosses the border leaves nothing behind. */
public class NativeMemoryTest extends EngineTestCase {
    private static final int WARM_UP = 10_000;
    private static final int CONVERSIONS = 100_000;
    private static final long KIB_ALLOWED = 4 * 1024;

    /** Resident memory of this process in KiB; the Java heap has all of its memory from the start. */
    private static long residentKib() throws IOException {
        for (String line : Files.readAllLines(Paths.get("/proc/self/status"))) {
            if (line.startsWith("VmRSS:")) {
                return Long.parseLong(line.replaceAll("\\D", ""));
            }
        }
        throw new IOException("no VmRSS");
    }

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
        System.gc();
        final long before = residentKib();
        convert(bundle, CONVERSIONS);
        System.gc();
        final long grown = residentKib() - before;
        // 40 bytes for each conversion: less than a text or an element that is lost.
        assertTrue("grown by " + grown + " KiB", grown < KIB_ALLOWED);
    }
}
