package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import java.util.ArrayDeque;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Queue;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.RejectedExecutionException;
import java.util.concurrent.atomic.AtomicInteger;
import korvel.talvox.support.KitTest;
import org.junit.Test;

public class SerialExecutorTest extends KitTest {
    @Test
    public void keepsTheOrderOnAPoolOfThreads() throws Exception {
        final ExecutorService pool = Executors.newFixedThreadPool(8);
        final SerialExecutor serial = new SerialExecutor(pool);
        final List<Integer> seen = new ArrayList<>();
        final AtomicInteger running = new AtomicInteger();
        final AtomicInteger mostAtOnce = new AtomicInteger();
        final CountDownLatch done = new CountDownLatch(1000);
        final List<Integer> expected = new ArrayList<>();
        for (int i = 0; i < 1000; i++) {
            final int number = i;
            expected.add(i);
            serial.execute(
                    () -> {
                        mostAtOnce.accumulateAndGet(running.incrementAndGet(), Math::max);
                        seen.add(number);
                        running.decrementAndGet();
                        done.countDown();
                    });
        }
        await(done);
        pool.shutdown();
        assertEquals(expected, seen);
        assertEquals(1, mostAtOnce.get());
    }

    @Test
    public void goesOnAfterATaskThatThrows() {
        final Queue<Runnable> turns = new ArrayDeque<>();
        final SerialExecutor serial = new SerialExecutor(turns::add);
        final List<String> seen = new ArrayList<>();
        serial.execute(
                () -> {
                    throw new IllegalStateException("a fault of the application");
                });
        serial.execute(() -> seen.add("second"));
        assertThrows(IllegalStateException.class, () -> turns.remove().run());
        turns.remove().run();
        serial.execute(() -> seen.add("third"));
        turns.remove().run();
        assertEquals(Arrays.asList("second", "third"), seen);
        assertTrue(turns.isEmpty());
    }

    @Test
    public void runsATaskFromInsideATaskAfterwards() {
        final SerialExecutor serial = new SerialExecutor(Runnable::run);
        final List<String> seen = new ArrayList<>();
        serial.execute(
                () -> {
                    serial.execute(() -> seen.add("inner"));
                    seen.add("outer");
                });
        assertEquals(Arrays.asList("outer", "inner"), seen);
    }

    @Test
    public void logsTasksThatTheExecutorRefuses() {
        final SerialExecutor serial =
                new SerialExecutor(
                        task -> {
                            throw new RejectedExecutionException("closed");
                        });
        serial.execute(() -> {});
        assertLogged("the executor for events refuses them: they are lost");
    }
}
