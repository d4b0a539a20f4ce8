package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;

import java.util.concurrent.CountDownLatch;
import java.util.concurrent.TimeUnit;
import korvel.talvox.support.KitTest;
import org.junit.Test;

public class SafetyNetTest extends KitTest {
    /** Collects garbage until the latch opens. */
    private static void collectUntil(CountDownLatch latch) throws InterruptedException {
        for (int i = 0; i < 200 && !latch.await(50, TimeUnit.MILLISECONDS); i++) {
            System.gc();
        }
        assertEquals("was not collected", 0, latch.getCount());
    }

    @Test
    public void logsAndClosesWhatIsDropped() throws Exception {
        final CountDownLatch closed = new CountDownLatch(1);
        SafetyNet.watch(new Object(), "a forgotten thing", closed::countDown);
        collectUntil(closed);
        assertLogged("a forgotten thing was dropped without close(); it is closed now");
    }

    @Test
    public void leavesAloneWhatWasClosed() throws Exception {
        final CountDownLatch closedTwice = new CountDownLatch(1);
        SafetyNet.watch(new Object(), "a closed thing", closedTwice::countDown).end();
        final CountDownLatch later = new CountDownLatch(1);
        SafetyNet.watch(new Object(), "another thing", later::countDown);
        collectUntil(later);
        assertEquals(1, closedTwice.getCount());
    }
}
