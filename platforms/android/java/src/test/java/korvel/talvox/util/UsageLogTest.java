package korvel.talvox.util;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

public class UsageLogTest extends EngineTestCase {
    private RecordingGateway endpoint;

    @Before
    public void open() {
        endpoint = new RecordingGateway(true);
        LogCollector.configure(UUID, endpoint.getUrl() + "/log");
        LogCollector.setLoggingEnabled(true);
    }

    @After
    public void close() {
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
}
