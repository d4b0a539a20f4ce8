package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;
import static org.robolectric.Shadows.shadowOf;

import android.Manifest;
import android.os.Looper;
import java.lang.ref.PhantomReference;
import java.lang.ref.Reference;
import java.lang.ref.ReferenceQueue;
import java.util.Arrays;
import java.util.List;
import java.util.concurrent.ArrayBlockingQueue;
import java.util.concurrent.BlockingQueue;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.RejectedExecutionException;
import java.util.concurrent.TimeUnit;
import java.util.concurrent.atomic.AtomicInteger;
import java.util.concurrent.atomic.AtomicReference;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.DevelopmentGateway;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.Microphone;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.AfterClass;
import org.junit.Before;
import org.junit.BeforeClass;
import org.junit.Test;

/** Recognitions from the Java API to the gateway and back, by the real library. */
public class TalvoxRecognizerTest extends EngineTestCase {
    private static final TalvoxSettings NOTHING = TalvoxSettings.builder().build();
    private static final int SPEED = 4;

    private static DevelopmentGateway gateway;
    private Microphone microphone;

    @BeforeClass
    public static void startGateway() {
        gateway = new DevelopmentGateway();
    }

    @AfterClass
    public static void stopGateway() {
        gateway.close();
    }

    @Before
    public void plugIn() {
        Connectivity.wifi(application);
        microphone = new Microphone(16000, SPEED).plugIn();
    }

    @After
    public void unplug() {
        microphone.close();
    }

    /** Says a phrase as soon as the recording has begun, like a user who waits for the sign. */
    private class Speaker extends Events {
        @Override
        public void onRecordingBegin() {
            super.onRecordingBegin();
            microphone.say(Microphone.recording("goforward.raw"));
        }
    }

    private static void assertGoForward(Events events) {
        final List<String> expected =
                Arrays.asList("recordingBegin", "speakingBegin", "recordingDone", "results");
        assertEquals(expected, events.getAll());
        final String best = events.getRecognition().getHypotheses().get(0).getText();
        assertTrue(best, best.contains("go forward"));
        assertFalse(events.getRecognition().getRequestId().isEmpty());
        assertTrue(events.getLevels() > 0);
        assertTrue(events.getSound().length > 32000);
    }

    @Test
    public void recognisesSpeechAndDeliversItOnTheMainLooper() throws Exception {
        useGateway(gateway.getUrl());
        final Events events = new Speaker();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            recognizer.start();
            assertEquals("results", events.end());
        }
        assertGoForward(events);
        assertSame(Looper.getMainLooper().getThread(), events.getThread());
    }

    @Test
    public void recognisesStreamedSpeexInALanguageOfItsOwn() throws Exception {
        engine.updateSettingsFromXml(
                "<startup><features><voice><url>" + gateway.getUrl() + "</url><uuid>" + UUID
                        + "</uuid><streaming>yes</streaming><soundformat>speex</soundformat>"
                        + "</voice></features></startup>");
        final Events events = new Speaker();
        final TalvoxSettings english =
                TalvoxSettings.builder().set(TalvoxSettings.LANGUAGE, "en-US").build();
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(english, events, Runnable::run)) {
            recognizer.start();
            assertEquals("results", events.end());
        }
        assertGoForward(events);
    }

    @Test
    public void stopEndsListeningAndTheAnswerComes() throws Exception {
        useGateway(gateway.getUrl());
        final AtomicReference<TalvoxRecognizer> stopped = new AtomicReference<>();
        final Events events =
                new Speaker() {
                    @Override
                    public void onSpeakingBegin() {
                        super.onSpeakingBegin();
                        stopped.get().stop();
                    }
                };
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            stopped.set(recognizer);
            recognizer.start();
            assertEquals("results", events.end());
        }
        assertTrue(events.getAll().contains("recordingDone"));
    }

    @Test
    public void aSecondOneIsBusy() throws Exception {
        useGateway(gateway.getUrl());
        final Events first = new Events();
        final Events second = new Events();
        try (TalvoxRecognizer running = engine.createRecognizer(NOTHING, first);
                TalvoxRecognizer refused = engine.createRecognizer(NOTHING, second)) {
            running.start();
            refused.start();
            assertEquals("error BUSY", second.end());
            running.cancel();
            assertEquals("error CANCELED", first.end());
        }
        assertEquals(1, second.getAll().size());
    }

    @Test
    public void mayBeCancelledFromInsideAnEvent() throws Exception {
        for (boolean direct : new boolean[] {false, true}) {
            useGateway(gateway.getUrl());
            final AtomicReference<TalvoxRecognizer> self = new AtomicReference<>();
            final Events events =
                    new Speaker() {
                        @Override
                        public void onRecordingBegin() {
                            super.onRecordingBegin();
                            self.get().cancel();
                            self.get().cancel();
                        }
                    };
            try (TalvoxRecognizer recognizer =
                    direct
                            ? engine.createRecognizer(NOTHING, events, Runnable::run)
                            : engine.createRecognizer(NOTHING, events)) {
                self.set(recognizer);
                recognizer.start();
                assertEquals("error CANCELED", events.end());
            }
            assertEquals("recordingBegin", events.getAll().get(0));
            assertEquals(1, count(events, "error CANCELED"));
        }
    }

    private static long count(Events events, String event) {
        return events.getAll().stream().filter(event::equals).count();
    }

    @Test
    public void theNextOneMayStartFromInsideOnResults() throws Exception {
        useGateway(gateway.getUrl());
        final Events second = new Speaker();
        final AtomicReference<TalvoxRecognizer> next = new AtomicReference<>();
        final Events first =
                new Speaker() {
                    @Override
                    public void onResults(Recognition recognition) {
                        super.onResults(recognition);
                        next.set(engine.createRecognizer(NOTHING, second, Runnable::run));
                        next.get().start();
                    }
                };
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(NOTHING, first, Runnable::run)) {
            recognizer.start();
            assertEquals("results", first.end());
            assertEquals("results", second.end());
        }
        next.get().close();
        assertGoForward(first);
        assertGoForward(second);
    }

    @Test
    public void closingDuringASessionSilencesIt() throws Exception {
        useGateway(gateway.getUrl());
        final AtomicReference<TalvoxRecognizer> self = new AtomicReference<>();
        final CountDownLatch closed = new CountDownLatch(1);
        final Events events =
                new Speaker() {
                    @Override
                    public void onSpeakingBegin() {
                        super.onSpeakingBegin();
                        self.get().close();
                        closed.countDown();
                    }
                };
        self.set(engine.createRecognizer(NOTHING, events));
        self.get().start();
        await(closed);
        final Events next = new Events();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, next)) {
            recognizer.start(); // not busy: the closed one is gone
            recognizer.cancel();
            assertEquals("error CANCELED", next.end());
        }
        drainMain();
        assertEquals(Arrays.asList("recordingBegin", "speakingBegin"), events.getAll());
    }

    @Test
    public void closingDoesNotWaitForAGatewayThatNeverAnswers() throws Exception {
        try (RecordingGateway silent = new RecordingGateway(false)) {
            useGateway(silent.getUrl());
            final Events events = new Speaker();
            try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
                recognizer.start();
                silent.take();
            }
            drainMain();
            assertFalse(events.getAll().contains("results"));
            assertEquals(0, events.getAll().stream().filter(e -> e.startsWith("error")).count());
        }
    }

    @Test
    public void reportsWhatIsMissing() throws Exception {
        final Events noAddress = new Events();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, noAddress)) {
            recognizer.start();
            assertEquals("error NETWORK", noAddress.end());
        }
        final Events disabled = new Events();
        final TalvoxSettings settings =
                TalvoxSettings.builder().set(TalvoxSettings.ASR_POLICY, AsrPolicy.DISABLED).build();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(settings, disabled)) {
            recognizer.start();
            recognizer.stop();
            recognizer.cancel();
            assertEquals("error NOT_AVAILABLE", disabled.end());
        }
        drainMain();
        assertEquals(1, disabled.getAll().size());
    }

    @Test
    public void withoutThePermissionItIsAnErrorOfTheSoundAndTheLogSaysWhy() throws Exception {
        useGateway(gateway.getUrl());
        shadowOf(application).denyPermissions(Manifest.permission.RECORD_AUDIO);
        final Events events = new Events();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            recognizer.start();
            assertEquals("error AUDIO", events.end());
        }
        assertLogged("RECORD_AUDIO");
    }

    @Test
    public void misuseIsAnsweredWithClearExceptions() throws Exception {
        useGateway(gateway.getUrl());
        final Events events = new Events();
        final TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events);
        assertRefused("stop: the recognizer has not been started", recognizer::stop);
        assertRefused("cancel: the recognizer has not been started", recognizer::cancel);
        recognizer.start();
        assertRefused(
                "start: a recognizer can be started once; create another one", recognizer::start);
        recognizer.cancel();
        assertEquals("error CANCELED", events.end());
        recognizer.cancel();
        recognizer.stop();
        recognizer.close();
        recognizer.close();
        assertRefused("start: the recognizer is closed", recognizer::start);
        assertRefused("stop: the recognizer is closed", recognizer::stop);
        assertRefused("cancel: the recognizer is closed", recognizer::cancel);
        drainMain();
        assertEquals(1, events.getAll().size());
    }

    private static void assertRefused(String message, Runnable misuse) {
        assertEquals(
                message, assertThrows(IllegalStateException.class, misuse::run).getMessage());
    }

    @Test
    public void anExceptionInsideAnEventIsLoggedAndTheSessionGoesOn() throws Exception {
        useGateway(gateway.getUrl());
        final Events events =
                new Speaker() {
                    @Override
                    public void onSpeakingBegin() {
                        super.onSpeakingBegin();
                        throw new IllegalArgumentException("a fault of the application");
                    }
                };
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(NOTHING, events, Runnable::run)) {
            recognizer.start();
            assertEquals("results", events.end());
        }
        assertGoForward(events);
        assertLogged("a fault of the application");
    }

    @Test
    public void oneThatIsDroppedInMidSessionStillDeliversItsEnd() throws Exception {
        useGateway(gateway.getUrl());
        final Events events =
                new Speaker() {
                    @Override
                    public void onSpeakingBegin() {
                        super.onSpeakingBegin();
                        System.gc();
                    }
                };
        engine.createRecognizer(NOTHING, events).start();
        assertEquals("results", events.end());
        assertGoForward(events);
    }

    /** Starts a recognition that ends at once, with an executor that refuses everything. */
    private PhantomReference<Object> failUnheard(ReferenceQueue<Object> collected) {
        final TalvoxRecognizer recognizer =
                engine.createRecognizer(
                        NOTHING,
                        new Events(),
                        task -> {
                            throw new OutOfMemoryError("no thread for an event");
                        });
        recognizer.start(); // there is no address
        return new PhantomReference<>(recognizer, collected);
    }

    @Test
    public void aLastEventThatIsRefusedFreesTheRecognizer() throws Exception {
        final ReferenceQueue<Object> collected = new ReferenceQueue<>();
        final PhantomReference<Object> recognizer = failUnheard(collected);
        assertLogged("the executor refuses an event, which is lost");
        Reference<?> gone = null;
        for (int i = 0; i < 200 && gone == null; i++) {
            System.gc();
            gone = collected.remove(50);
        }
        assertSame(recognizer, gone);
    }

    @Test
    public void anExecutorThatRefusesOneEventCostsNoOther() throws Exception {
        useGateway(gateway.getUrl());
        final Events events = new Speaker();
        final AtomicInteger calls = new AtomicInteger();
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(
                        NOTHING,
                        events,
                        task -> {
                            if (calls.incrementAndGet() == 2) { // sound or level
                                throw new RejectedExecutionException("busy");
                            }
                            task.run();
                        })) {
            recognizer.start();
            assertEquals("results", events.end());
        }
        assertGoForward(events);
    }

    @Test
    public void eightThreadsMayCallAtOnce() throws Exception {
        try (RecordingGateway answering = new RecordingGateway(true)) {
            useGateway(answering.getUrl());
            final BlockingQueue<Throwable> failures = new ArrayBlockingQueue<>(8);
            final CountDownLatch done = new CountDownLatch(8);
            final AtomicInteger ends = new AtomicInteger();
            for (int i = 0; i < 8; i++) {
                final int number = i;
                new Thread(
                                () -> {
                                    try {
                                        useFromOneThread(number, ends);
                                    } catch (Throwable failure) {
                                        failures.offer(failure);
                                    } finally {
                                        done.countDown();
                                    }
                                })
                        .start();
            }
            await(done);
            final Throwable failure = failures.poll(0, TimeUnit.SECONDS);
            if (failure != null) {
                throw new AssertionError(failure);
            }
            assertEquals(8 * 10, ends.get());
        }
    }

    private void useFromOneThread(int number, AtomicInteger ends) throws Exception {
        for (int i = 0; i < 10; i++) {
            engine.updateSettings(
                    TalvoxSettings.builder()
                            .set(TalvoxSettings.SESSION_ID, "thread-" + number + "-" + i)
                            .build());
            assertEquals(UUID, engine.getSettings().get(TalvoxSettings.UUID));
            final Events events = new Events();
            try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
                recognizer.start();
                recognizer.stop();
                recognizer.cancel();
                events.end();
                ends.incrementAndGet();
            }
        }
    }
}
