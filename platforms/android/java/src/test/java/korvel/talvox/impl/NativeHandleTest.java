package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.atomic.AtomicBoolean;
import java.util.concurrent.atomic.AtomicInteger;
import korvel.talvox.support.KitTest;
import org.junit.Test;

public class NativeHandleTest extends KitTest {
    @Test
    public void isReleasedOnce() {
        final List<Long> released = new ArrayList<>();
        final NativeHandle handle = new NativeHandle(7, released::add);
        handle.close();
        handle.close();
        assertEquals(Arrays.asList(7L), released);
    }

    @Test
    public void isNotUsedAfterItsRelease() {
        final NativeHandle handle = new NativeHandle(7, released -> {});
        assertTrue(handle.use(used -> {}));
        handle.close();
        final List<Long> uses = new ArrayList<>();
        assertFalse(handle.use(uses::add));
        assertTrue(uses.isEmpty());
    }

    @Test
    public void isReleasedAfterTheUseThatClosesIt() {
        final List<String> order = new ArrayList<>();
        final NativeHandle[] handle = new NativeHandle[1];
        handle[0] = new NativeHandle(7, released -> order.add("release"));
        handle[0].use(
                used -> {
                    handle[0].close();
                    assertFalse(handle[0].use(again -> order.add("use of a closed handle")));
                    order.add("use");
                });
        assertEquals(Arrays.asList("use", "release"), order);
    }

    @Test
    public void isReleasedByTheLastUserOfManyThreads() throws Exception {
        final AtomicInteger inUse = new AtomicInteger();
        final AtomicInteger releases = new AtomicInteger();
        final AtomicBoolean usedWhileReleased = new AtomicBoolean();
        final NativeHandle handle =
                new NativeHandle(
                        7,
                        released -> {
                            releases.incrementAndGet();
                            usedWhileReleased.set(inUse.get() != 0);
                        });
        final CountDownLatch busy = new CountDownLatch(8);
        final List<Thread> threads = new ArrayList<>();
        for (int i = 0; i < 8; i++) {
            final Thread thread =
                    new Thread(
                            () -> {
                                boolean alive = true;
                                while (alive) {
                                    alive =
                                            handle.use(
                                                    used -> {
                                                        inUse.incrementAndGet();
                                                        busy.countDown();
                                                        inUse.decrementAndGet();
                                                    });
                                }
                            });
            thread.start();
            threads.add(thread);
        }
        await(busy);
        handle.close();
        for (Thread thread : threads) {
            thread.join();
        }
        assertEquals(1, releases.get());
        assertFalse(usedWhileReleased.get());
    }
}
