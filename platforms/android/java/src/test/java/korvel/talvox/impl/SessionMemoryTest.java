package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
import java.lang.management.ManagementFactory;
import java.lang.ref.PhantomReference;
import java.lang.ref.Reference;
import java.lang.ref.ReferenceQueue;
import java.util.ArrayList;
import java.util.HashSet;
import java.util.List;
import java.util.Set;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import javax.management.ObjectName;
import korvel.talvox.AsrPolicy;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.Microphone;
import korvel.talvox.support.RecordingGateway;
import korvel.talvox.support.ResidentMemory;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

/** Sessions that are over leave nothing behind, however they ended. */
public class SessionMemoryTest extends EngineTestCase {
    private static final int WARM_UP = 300;
    private static final int SESSIONS = 1_000;
    private static final int KINDS = 4;
    private static final int RECORDED_EVERY = 50;
    private static final int SPEED = 4;
    private static final long KIB_ALLOWED = 4 * 1024;
    // The VM counts those of its own compiler, too, while that works. What the rarest kind of
    // session left behind would be more.
    private static final int REFERENCES_ALLOWED = SESSIONS / RECORDED_EVERY / 2;
    private static final int COLLECTIONS = 200;
    private static final int COLLECTION_WAIT_MS = 50;

    private static final TalvoxSettings NOTHING = TalvoxSettings.builder().build();
    private static final TalvoxSettings DISABLED =
            TalvoxSettings.builder().set(TalvoxSettings.ASR_POLICY, AsrPolicy.DISABLED).build();

    private final ReferenceQueue<Object> collected = new ReferenceQueue<>();
    private final Set<Reference<Object>> watched = new HashSet<>();
    private RecordingGateway gateway;
    private Microphone microphone;

    @Before
    public void plugIn() {
        Connectivity.wifi(application);
        microphone = new Microphone(16000, SPEED).plugIn();
        gateway = new RecordingGateway(true);
        useGateway(gateway.getUrl());
    }

    @After
    public void unplug() {
        microphone.close();
        gateway.close();
    }

    /** References of native code to Java objects in this VM, as its list of threads says. */
    private static int globalReferences() throws Exception {
        final Object threads =
                ManagementFactory.getPlatformMBeanServer()
                        .invoke(
                                new ObjectName("com.sun.management:type=DiagnosticCommand"),
                                "threadPrint",
                                new Object[] {new String[0]},
                                new String[] {String[].class.getName()});
        final Matcher count = Pattern.compile("JNI global refs: (\\d+)").matcher((String) threads);
        assertTrue("no count of references", count.find());
        return Integer.parseInt(count.group(1));
    }

    private <T> T watch(T object) {
        watched.add(new PhantomReference<>(object, collected));
        return object;
    }

    private void collectAll() throws InterruptedException {
        for (int i = 0; i < COLLECTIONS && !watched.isEmpty(); i++) {
            System.gc();
            Reference<?> gone = collected.remove(COLLECTION_WAIT_MS);
            while (gone != null) {
                watched.remove(gone);
                gone = collected.poll();
            }
        }
        assertEquals("not collected", 0, watched.size());
    }

    private TalvoxRecognizer create(TalvoxSettings settings, Events events) {
        return watch(engine.createRecognizer(settings, events));
    }

    private void fail(TalvoxSettings settings, String error) throws InterruptedException {
        final Events events = watch(new Events());
        try (TalvoxRecognizer recognizer = create(settings, events)) {
            recognizer.start();
            assertEquals(error, events.end());
        }
    }

    private void failWithoutAddress() throws InterruptedException {
        forgetGateway();
        fail(NOTHING, "error NETWORK");
        useGateway(gateway.getUrl());
    }

    private void cancelAtOnce() throws InterruptedException {
        final Events events = watch(new Events());
        try (TalvoxRecognizer recognizer = create(NOTHING, events)) {
            recognizer.start();
            recognizer.cancel();
            assertEquals("error CANCELED", events.end());
        }
    }

    private void cancelWhileRecording() throws InterruptedException {
        final Events events = watch(new Events());
        try (TalvoxRecognizer recognizer = create(NOTHING, events)) {
            recognizer.start();
            assertEquals("recordingBegin", events.next());
            recognizer.cancel();
            assertEquals("error CANCELED", events.end());
        }
    }

    private void closeWhileAnotherOneRuns() throws InterruptedException {
        try (TalvoxRecognizer running = create(NOTHING, watch(new Events()))) {
            running.start();
            fail(NOTHING, "error BUSY");
        }
    }

    private void runSession(int index) throws InterruptedException {
        if (index % RECORDED_EVERY == 0) {
            cancelWhileRecording();
            return;
        }
        switch (index % KINDS) {
            case 0:
                cancelAtOnce();
                break;
            case 1:
                closeWhileAnotherOneRuns();
                break;
            case 2:
                failWithoutAddress();
                break;
            default:
                fail(DISABLED, "error NOT_AVAILABLE");
                break;
        }
    }

    private void runSessions(int count) throws Exception {
        for (int index = 0; index < count; index++) {
            runSession(index);
        }
        drainMain();
        collectAll();
    }

    @Test
    public void aThousandSessionsLeaveNothing() throws Exception {
        runSessions(WARM_UP);
        final int before = globalReferences();
        // 4 KiB for each session: less than what one of them holds while it runs.
        ResidentMemory.assertDoesNotGrow(KIB_ALLOWED, () -> runSessions(SESSIONS));
        final int more = globalReferences() - before;
        assertTrue(more + " more references", more <= REFERENCES_ALLOWED);
    }

    private static long getNumber(NativeHandle handle) {
        final List<Long> numbers = new ArrayList<>();
        handle.use(numbers::add);
        return numbers.get(0);
    }

    @Test
    public void noHandleOfAThousandSessionsIsLeft() {
        final Set<Long> numbers = new HashSet<>();
        for (int index = 0; index < SESSIONS; index++) {
            final NativeHandle handle =
                    Recognizer.start(Talvox.getHandle(), new Bundle(), new SilentEvents());
            numbers.add(getNumber(handle));
            if (index % 2 == 0) {
                Recognizer.cancel(handle);
            }
            handle.close();
        }
        for (long number : numbers) {
            final NativeHandle stale = new NativeHandle(number, released -> {});
            assertEquals(
                    "released already (stale handle)",
                    assertThrows(IllegalStateException.class, () -> Recognizer.cancel(stale))
                            .getMessage());
        }
    }
}
