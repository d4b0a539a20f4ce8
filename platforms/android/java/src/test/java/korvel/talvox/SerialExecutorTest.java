package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import java.util.ArrayDeque;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.Queue;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.Executor;
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

    /** Throws what a test wants, before or after it takes a task; else it keeps the task. */
    private static final class Moody implements Executor {
        final Queue<Runnable> turns = new ArrayDeque<>();
        Throwable before;
        Throwable after;

        @Override
        public void execute(Runnable task) {
            raise(before);
            turns.add(task);
            raise(after);
        }

        private static void raise(Throwable failure) {
            if (failure instanceof Error) {
                throw (Error) failure;
            } else if (failure != null) {
                throw (RuntimeException) failure;
            }
        }

        void runAll() {
            while (!turns.isEmpty()) {
                turns.remove().run();
            }
        }
    }

    @Test
    public void anExecutorThatThrowsOnceCostsOneTask() {
        for (Throwable failure :
                new Throwable[] {
                    new RejectedExecutionException("closed"),
                    new IllegalStateException("confused"),
                    new OutOfMemoryError("no thread"),
                    new StackOverflowError(),
                    new AssertionError("broken")
                }) {
            final Moody moody = new Moody();
            final SerialExecutor serial = new SerialExecutor(moody);
            final List<String> seen = new ArrayList<>();
            serial.execute(() -> seen.add("first"), () -> seen.add("first lost"));
            moody.runAll();
            moody.before = failure;
            serial.execute(() -> seen.add("second"), () -> seen.add("second lost"));
            moody.before = null;
            serial.execute(() -> seen.add("third"), () -> seen.add("third lost"));
            moody.runAll();
            assertEquals(Arrays.asList("first", "second lost", "third"), seen);
        }
        assertLogged("the executor refuses an event, which is lost");
    }

    @Test
    public void anExecutorThatAlwaysThrowsLosesEveryTaskInOrder() {
        final Moody moody = new Moody();
        moody.before = new OutOfMemoryError("no thread");
        final SerialExecutor serial = new SerialExecutor(moody);
        final List<Integer> lost = new ArrayList<>();
        final List<Integer> expected = new ArrayList<>();
        for (int i = 0; i < 100; i++) {
            final int number = i;
            expected.add(i);
            serial.execute(() -> lost.add(-1), () -> lost.add(number));
        }
        assertEquals(expected, lost);
    }

    @Test
    public void aTaskThatHasBeenTakenIsNotLostWhenTheExecutorThrows() {
        final List<String> seen = new ArrayList<>();
        final SerialExecutor direct =
                new SerialExecutor(
                        task -> {
                            task.run();
                            throw new IllegalStateException("afterwards");
                        });
        direct.execute(() -> seen.add("ran"), () -> seen.add("lost"));
        direct.execute(() -> seen.add("ran again"), () -> seen.add("lost"));
        assertEquals(Arrays.asList("ran", "ran again"), seen);
        assertLogged("the executor has taken an event, and thrown");
    }

    @Test
    public void aTurnThatComesAfterItsRefusalRunsNothing() {
        final Moody moody = new Moody();
        final SerialExecutor serial = new SerialExecutor(moody);
        final List<String> seen = new ArrayList<>();
        moody.after = new RejectedExecutionException("perhaps");
        serial.execute(() -> seen.add("first"), () -> seen.add("first lost"));
        moody.after = null;
        serial.execute(() -> seen.add("second"));
        serial.execute(() -> seen.add("third"));
        moody.turns.remove().run(); // that of the first
        assertEquals(Arrays.asList("first lost"), seen);
        moody.runAll();
        assertEquals(Arrays.asList("first lost", "second", "third"), seen);
    }

    @Test
    public void whatWaitsBehindARefusedTurnIsAskedForAgain() {
        final Queue<Runnable> turns = new ArrayDeque<>();
        final List<String> seen = new ArrayList<>();
        final SerialExecutor[] self = new SerialExecutor[1];
        final SerialExecutor serial =
                new SerialExecutor(
                        task -> {
                            if (turns.isEmpty()) {
                                turns.add(() -> {}); // only the first is refused
                                self[0].execute(() -> seen.add("second"));
                                throw new RejectedExecutionException("busy");
                            }
                            turns.add(task);
                        });
        self[0] = serial;
        serial.execute(() -> seen.add("first"), () -> seen.add("first lost"));
        turns.forEach(Runnable::run);
        assertEquals(Arrays.asList("first lost", "second"), seen);
    }

    @Test
    public void whatATaskThrowsReachesTheCallerOfAnExecutorThatRunsItAtOnce() {
        final SerialExecutor serial = new SerialExecutor(Runnable::run);
        final List<String> seen = new ArrayList<>();
        final IllegalStateException fault = new IllegalStateException("the application's");
        final IllegalStateException thrown =
                assertThrows(
                        IllegalStateException.class,
                        () ->
                                serial.execute(
                                        () -> {
                                            serial.execute(() -> seen.add("inner"));
                                            serial.execute(
                                                    () -> {
                                                        throw new IllegalStateException("next");
                                                    });
                                            throw fault;
                                        },
                                        () -> seen.add("lost")));
        assertSame(fault, thrown);
        serial.execute(() -> seen.add("later"));
        assertEquals(Arrays.asList("inner", "later"), seen);
        assertLogged("an event after one that has thrown has thrown as well");
    }
}
