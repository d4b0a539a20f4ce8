package korvel.talvox.util;

import static java.nio.charset.StandardCharsets.UTF_8;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
import java.io.File;
import java.io.IOException;
import java.nio.file.Files;
import java.time.LocalDateTime;
import java.time.ZoneOffset;
import java.util.Arrays;
import java.util.HashSet;
import java.util.Set;
import java.util.concurrent.RejectedExecutionException;
import java.util.concurrent.Semaphore;
import java.util.concurrent.TimeUnit;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.Before;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;
import org.robolectric.shadows.ShadowLog;

public class UsageLogTest extends EngineTestCase {
    @Rule public final TemporaryFolder temporary = new TemporaryFolder();

    private RecordingGateway endpoint;

    @Before
    public void open() {
        endpoint = new RecordingGateway(true);
        LogCollector.configure(UUID, endpoint.getUrl() + "/log");
        LogCollector.setLoggingEnabled(true);
    }

    @After
    public void close() {
        LogCollector.clearDeliveredCallback();
        LogCollector.setLoggingEnabled(false);
        endpoint.close();
    }

    /** The next record, without the time that it begins with. */
    private String takeRecord() throws InterruptedException {
        final RecordingGateway.Request request = endpoint.take();
        assertEquals("/log", request.path);
        final String prefix = "uuid=" + UUID + "&logmessage=time=";
        assertTrue(request.query, request.query.startsWith(prefix));
        return request.query.substring(request.query.indexOf(';') + 1);
    }

    @Test
    public void sendsEventsAndErrorsAndTheEndOfTheSession() throws Exception {
        final Bundle parameters = new Bundle();
        parameters.putInt("count", 3);
        parameters.putString("город", "Москва \uD83D\uDE00");
        parameters.putBoolean("b", true);
        try (UsageLog log = UsageLog.open("tour")) {
            log.event("page", parameters);
            assertEquals(
                    "sessionId=tour;type=event;name=page;b=true;count=3;город=Москва \uD83D\uDE00",
                    takeRecord());
            log.error("fault");
            assertEquals("sessionId=tour;type=error;name=fault", takeRecord());
        }
        assertEquals("sessionId=tour;type=event;name=logSessionStopped", takeRecord());
    }

    @Test
    public void aNullAmongTheParametersDoesNotStopTheEvent() throws Exception {
        final Bundle parameters = new Bundle();
        parameters.putString("nothing", null);
        parameters.putString("some", "thing");
        try (UsageLog log = UsageLog.open("nulls")) {
            log.event("page", parameters);
            assertTrue(takeRecord().endsWith(";some=thing"));
        }
        takeRecord();
    }

    @Test
    public void sendsNothingWhileDisabled() {
        LogCollector.setLoggingEnabled(false);
        assertFalse(LogCollector.isLoggingEnabled());
        try (UsageLog log = UsageLog.open("off")) {
            log.event("page");
        }
        assertTrue(endpoint.isEmpty());
    }

    /** All bytes of the files in a folder; those of a record are among them as they are. */
    private static String bytesOf(File folder) throws IOException {
        final StringBuilder bytes = new StringBuilder();
        for (File file : folder.listFiles()) {
            bytes.append(new String(Files.readAllBytes(file.toPath()), UTF_8));
        }
        return bytes.toString();
    }

    @Test
    public void keepsRecordsInAFolderUntilTheyAreDelivered() throws Exception {
        final File folder = new File(temporary.getRoot(), "usage");
        LogCollector.configure(UUID, "http://"); // where no record can go
        final File file = temporary.newFile();
        assertFalse(LogCollector.openStore(file));
        assertLogged(
                "LogStore: " + file + " is not used, records are in memory only: Not a directory");
        assertTrue(LogCollector.openStore(folder));
        assertFalse(LogCollector.openStore(folder));
        assertLogged("LogSender: there is a store already, " + folder + " is not used");
        try (UsageLog log = UsageLog.open("stored")) {
            log.event("page");
        }
        assertTrue(bytesOf(folder).contains(";sessionId=stored;type=event;name=page"));
        assertTrue(bytesOf(folder).contains(";sessionId=stored;type=event;name=logSessionStopped"));
        LogCollector.configure(UUID, endpoint.getUrl() + "/log");
        final Set<String> records = new HashSet<>(Arrays.asList(takeRecord(), takeRecord()));
        assertEquals(
                new HashSet<>(
                        Arrays.asList(
                                "sessionId=stored;type=event;name=page",
                                "sessionId=stored;type=event;name=logSessionStopped")),
                records);
    }

    @Test
    public void refusesBoundsOutOfRange() {
        final File folder = new File(temporary.getRoot(), "usage");
        final long bytes = LogCollector.STORE_BYTES;
        final long age = LogCollector.STORE_AGE_S;
        for (long bad : new long[] {-1, 4095, (1L << 30) + 1}) {
            assertThrows(
                    IllegalArgumentException.class,
                    () -> LogCollector.openStore(folder, bad, age));
        }
        for (long bad : new long[] {-1, 59, 100L * 365 * 24 * 60 * 60 + 1}) {
            assertThrows(
                    IllegalArgumentException.class,
                    () -> LogCollector.openStore(folder, bytes, bad));
        }
        assertFalse(folder.exists());
    }

    private static long timesSaid(String text) {
        return ShadowLog.getLogs().stream().filter(line -> line.msg.contains(text)).count();
    }

    @Test
    public void openingWhileDisabledIsSaidOnceUntilItIsEnabled() throws Exception {
        final String text = "usage logging is off: nothing is logged into the session ";
        UsageLog.open("on").close();
        takeRecord();
        assertEquals(0, timesSaid(text));
        LogCollector.setLoggingEnabled(false);
        UsageLog.open("one").close();
        UsageLog.open("two").close();
        assertEquals(1, timesSaid(text));
        assertLogged(text + "one");
        LogCollector.setLoggingEnabled(true);
        UsageLog.open("on").close();
        takeRecord();
        LogCollector.setLoggingEnabled(false);
        UsageLog.open("three").close();
        assertEquals(2, timesSaid(text));
        assertLogged(text + "three");
    }

    @Test
    public void theTimeOfARecordIsWhatTheJavadocSays() throws Exception {
        final long before = System.nanoTime();
        try (UsageLog log = UsageLog.open("time")) {
            log.event("page");
        }
        final long after = System.nanoTime();
        final Matcher time =
                Pattern.compile("logmessage=time=(\\d+)-(\\d+)-(\\d+) (\\d+):(\\d+):(\\d+);")
                        .matcher(endpoint.take().query);
        assertTrue(time.find());
        final long[] fields = new long[7];
        for (int i = 1; i < fields.length; i++) {
            fields[i] = Long.parseLong(time.group(i));
        }
        final long nanoseconds =
                LocalDateTime.of(
                                (int) fields[1] + 1900,
                                (int) fields[2] + 1,
                                (int) fields[3],
                                (int) fields[4],
                                (int) fields[5],
                                (int) fields[6])
                        .toEpochSecond(ZoneOffset.UTC);
        // The JVM's clock is the same one here.
        assertTrue(nanoseconds + " is not after " + before, nanoseconds >= before);
        assertTrue(nanoseconds + " is not before " + after, nanoseconds <= after);
        assertEquals(
                3_600_000_000_000L,
                LocalDateTime.of(114149 + 1900, 5 + 1, 16, 16, 0, 0)
                        .toEpochSecond(ZoneOffset.UTC));
        endpoint.take();
    }

    @Test
    public void refusesEventsAfterItsEnd() {
        final UsageLog log = UsageLog.open("short");
        log.close();
        log.close();
        assertThrows(IllegalStateException.class, () -> log.event("late"));
        assertThrows(IllegalStateException.class, () -> log.error("late"));
    }

    @Test
    public void refusesNull() {
        assertThrows(NullPointerException.class, () -> UsageLog.open(null));
        assertThrows(NullPointerException.class, () -> LogCollector.startLogSession(null));
        assertThrows(NullPointerException.class, () -> LogCollector.stopLogSession(null));
        assertThrows(NullPointerException.class, () -> LogCollector.setUuid(null));
        assertThrows(NullPointerException.class, () -> LogCollector.openStore(null));
        assertThrows(NullPointerException.class, () -> LogCollector.configure(null, ""));
        assertThrows(NullPointerException.class, () -> LogCollector.configure("", null));
        assertThrows(
                NullPointerException.class,
                () -> LogCollector.logEvent(null, "name", new Bundle()));
        assertThrows(
                NullPointerException.class, () -> LogCollector.logEvent("id", null, new Bundle()));
        assertThrows(NullPointerException.class, () -> LogCollector.logEvent("id", "name", null));
        assertThrows(NullPointerException.class, () -> LogCollector.logError("id", "name", null));
    }

    /** Logs a session, and waits for a call that finds everything delivered. */
    private void deliverAll(Semaphore calls) throws InterruptedException {
        UsageLog.open("last").close();
        do {
            assertTrue(calls.tryAcquire(PATIENCE_S, TimeUnit.SECONDS));
        } while (LogCollector.getPendingCount() > 0);
    }

    @Test
    public void countsWhatIsPendingAndSaysWhenAllIsDelivered() throws Exception {
        final Semaphore calls = new Semaphore(0);
        LogCollector.setDeliveredCallback(calls::release, Runnable::run);
        deliverAll(calls);
        LogCollector.configure(UUID, "http://"); // where no record can go
        try (UsageLog log = UsageLog.open("pending")) {
            log.event("page");
        }
        assertEquals(2, LogCollector.getPendingCount());
        LogCollector.configure(UUID, endpoint.getUrl() + "/log");
        deliverAll(calls);
        assertEquals(0, LogCollector.getPendingCount());
    }

    @Test
    public void anExecutorThatRefusesTheCallbackLosesTheCall() throws Exception {
        final Semaphore refusals = new Semaphore(0);
        LogCollector.setDeliveredCallback(
                () -> {},
                refused -> {
                    refusals.release();
                    throw new RejectedExecutionException("full");
                });
        UsageLog.open("refused").close();
        assertTrue(refusals.tryAcquire(PATIENCE_S, TimeUnit.SECONDS));
        final Semaphore calls = new Semaphore(0);
        LogCollector.setDeliveredCallback(calls::release, Runnable::run);
        deliverAll(calls);
        assertLogged("the executor refuses the callback of the usage log");
    }

    @Test
    public void aCallbackThatIsTakenBackIsNotCalled() throws Exception {
        final Semaphore calls = new Semaphore(0);
        LogCollector.setDeliveredCallback(calls::release, Runnable::run);
        LogCollector.clearDeliveredCallback();
        UsageLog.open("cleared").close();
        takeRecord();
        final Semaphore others = new Semaphore(0);
        LogCollector.setDeliveredCallback(others::release, Runnable::run);
        deliverAll(others);
        assertEquals(0, calls.availablePermits());
    }

    @Test
    public void theLogLevelDecidesWhatOfItsOwnItLogs() {
        final String step = "LogCollector::startSession: the logging is disabled.";
        LogCollector.setLoggingEnabled(false);
        LogCollector.startLogSession("quiet");
        assertEquals(0, timesSaid(step));
        LogCollector.setLogLevel(2);
        LogCollector.startLogSession("talkative");
        LogCollector.setLogLevel(1);
        LogCollector.startLogSession("quiet");
        assertEquals(1, timesSaid(step));
        for (int bad : new int[] {-1, 3}) {
            assertThrows(
                    IllegalArgumentException.class, () -> LogCollector.setLogLevel(bad));
        }
    }

    @Test
    public void theCertificateFileIsThatOfTheEngine() {
        final File missing = new File(temporary.getRoot(), "missing.pem");
        assertEquals(
                "certificate file " + missing + ": cannot be read: there is no such file",
                assertThrows(
                                IllegalArgumentException.class,
                                () -> LogCollector.setCertificateFile(missing))
                        .getMessage());
        LogCollector.setCertificateFile(null);
    }
}
