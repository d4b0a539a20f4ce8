package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;

import java.util.Arrays;
import java.util.List;
import korvel.talvox.support.KitTest;
import org.junit.Test;

public class PlatformErrorsTest extends KitTest {
    @Test
    public void mapsEveryErrorNumber() {
        // Index: the platform's number. 0 is none of its numbers, nor are those above 15.
        final List<Integer> codes =
                Arrays.asList(0, 3, 3, 1, 4, 0, 6, -1, 8, 1, 8, 4, 7, 7, 0, 0, 0, 0);
        for (int error = 0; error < codes.size(); error++) {
            assertEquals(
                    "error " + error, (int) codes.get(error), PlatformErrors.toEngine(error));
        }
        assertEquals(0, PlatformErrors.toEngine(-5));
    }
}
