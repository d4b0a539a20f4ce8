package korvel.talvox.support;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;
import static org.robolectric.Shadows.shadowOf;

import android.Manifest;
import android.app.Application;
import android.os.Handler;
import android.os.Looper;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.ExecutionException;
import java.util.concurrent.FutureTask;
import java.util.concurrent.TimeUnit;
import java.util.concurrent.TimeoutException;
import java.util.stream.Collectors;
import korvel.talvox.impl.AssertionProbe;
import org.junit.After;
import org.junit.Before;
import org.junit.Rule;
import org.junit.rules.TestWatcher;
import org.junit.runner.Description;
import org.junit.runner.RunWith;
import org.robolectric.RobolectricTestRunner;
import org.robolectric.RuntimeEnvironment;
import org.robolectric.annotation.Config;
import org.robolectric.annotation.LooperMode;
import org.robolectric.shadows.ShadowLog;

/**
 * A test with the framework classes and, as on a device, a main looper with a thread of its own.
 * All tests have this configuration: the native library can be loaded by one class loader only.
 *
 * <p>A test fails if native code reports a broken invariant during it, unless it expects that.
 */
@RunWith(RobolectricTestRunner.class)
@Config(sdk = 34)
@LooperMode(LooperMode.Mode.INSTRUMENTATION_TEST)
public abstract class KitTest {
    /** Longest wait for anything that has to come, in seconds. */
    public static final int PATIENCE_S = 20;

    /** Shows the log of a test that fails. */
    @Rule
    public final TestWatcher logOfFailures =
            new TestWatcher() {
                @Override
                protected void failed(Throwable failure, Description test) {
                    System.out.println("log of " + test.getMethodName() + ":\n" + log());
                }
            };

    protected Application application;
    private long assertionsBefore;
    private long expectedAssertions;

    @Before
    public final void prepare() {
        assertionsBefore = AssertionProbe.count();
        application = RuntimeEnvironment.getApplication();
        shadowOf(application).grantPermissions(Manifest.permission.RECORD_AUDIO);
    }

    /** Compares the reports with what the test expects. The clean-up of the test comes before. */
    @After
    public final void compareAssertions() {
        assertEquals(
                "broken invariants",
                expectedAssertions,
                AssertionProbe.count() - assertionsBefore);
    }

    /** Expects native code to report so many more broken invariants before the test has ended. */
    protected final void expectAssertions(long count) {
        expectedAssertions += count;
    }

    /** Runs something on the main looper and waits until it has run; what it throws comes here. */
    public static void onMain(Runnable action) {
        final FutureTask<Void> task = new FutureTask<>(action, null);
        new Handler(Looper.getMainLooper()).post(task);
        try {
            task.get(PATIENCE_S, TimeUnit.SECONDS);
        } catch (InterruptedException | ExecutionException | TimeoutException failure) {
            throw new AssertionError(failure);
        }
    }

    /** Waits until the main looper has run all that has been posted so far. */
    public static void drainMain() {
        onMain(() -> {});
    }

    protected static void await(CountDownLatch latch) {
        try {
            assertTrue("nothing came", latch.await(PATIENCE_S, TimeUnit.SECONDS));
        } catch (InterruptedException interrupted) {
            throw new AssertionError(interrupted);
        }
    }

    /** All that has been logged in this test, one line each. */
    protected static String log() {
        return ShadowLog.getLogs().stream()
                .map(item -> item.msg)
                .collect(Collectors.joining("\n"));
    }

    protected static void assertLogged(String text) {
        final String log = log();
        assertTrue("not logged: " + text + "\n" + log, log.contains(text));
    }
}
