package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
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
    private static final long KIB_ALLOWED = 48 * 1024;

    /** Resident memory of this process in KiB; the Java heap is among it, with its bounds. */
    private static long residentKib() throws IOException {
        for (String line : Files.readAllLines(Paths.get("/proc/self/status"))) {
            if (line.startsWith("VmRSS:")) {
                return Long.parseLong(line.replaceAll("\\D", ""));
            }
        }
        throw new IOException("no VmRSS");
    }

    private static Bundle fullBundle() {
        final Bundle bundle = Talvox.getSettings(Talvox.getHandle());
        assertEquals(21, bundle.size());
        bundle.putString("language", "язык😀\0");
        final Location location = new Location("test");
        location.setLatitude(10.5);
        bundle.putParcelable("myll", location);
        bundle.putInt("unknown", 1);
        return bundle;
    }

    private static void convert(Bundle bundle, int times) {
        for (int index = 0; index < times; index++) {
            Talvox.updateSettings(Talvox.getHandle(), bundle);
            if (index % 10 == 0) {
                Talvox.getSettings(Talvox.getHandle());
            }
        }
    }

    @Test
    public void aHundredThousandConversionsLeaveNothing() throws Exception {
        final Bundle bundle = fullBundle();
        bundle.remove("unknown"); // its log lines would be kept by the test's log
        convert(bundle, WARM_UP);
        System.gc();
        final long before = residentKib();
        convert(bundle, CONVERSIONS);
        System.gc();
        final long grown = residentKib() - before;
        // A lost reference or pair of texts per conversion would be several times as much.
        assertTrue("grown by " + grown + " KiB", grown < KIB_ALLOWED);
    }
}
