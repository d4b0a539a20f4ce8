package korvel.talvox.testing;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.content.ContextWrapper;
import java.util.ArrayList;
import java.util.List;
import java.util.Random;
import java.util.concurrent.Executor;
import korvel.talvox.Recognition;
import korvel.talvox.RecordingOptions;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;
import org.junit.After;
import org.junit.Test;

/** The engine's contract, as an application's test meets it. */
public class FakeEngineTest {
    private static final TalvoxSettings NOTHING = TalvoxSettings.forRecognition().build();
    private static final Executor DIRECT = Runnable::run;
    private static final Recognition GO = RecognitionBuilder.accepted("go");
    private static final String RESULTS = "results [go (1.0)]";

    private final FakeEngine fake = new FakeEngine();
    private final TalvoxEngine engine = fake.getEngine();
    private final HeardEvents events = new HeardEvents();

    @After
    public void close() {
        fake.close();
    }

    private static Script.Builder spoken() {
        return Script.cloud()
                .after(300).recordingBegin()
                .after(100).level(40).buffer(new byte[3200])
                .after(100).speakingBegin()
                .after(1000).recordingDone()
                .after(250);
    }

    private TalvoxRecognizer start(Script script) {
        fake.play(script);
        return start();
    }

    private TalvoxRecognizer start() {
        final TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events);
        recognizer.start();
        return recognizer;
    }

    private void assertHeard(String... expected) {
        assertEquals(List.of(expected), events.all);
    }

    @Test
    public void eachEventComesAtItsTime() {
        start(spoken().results(GO).build());
        fake.advanceBy(299);
        assertHeard();
        fake.advanceBy(1);
        assertHeard("recordingBegin");
        fake.advanceBy(100);
        assertHeard("recordingBegin", "level 40.0", "buffer 3200");
        fake.advanceBy(1349);
        assertHeard(
                "recordingBegin", "level 40.0", "buffer 3200", "speakingBegin", "recordingDone");
        assertTrue(fake.isRunning());
        fake.advanceBy(1);
        assertEquals(RESULTS, events.all.get(5));
        assertFalse(fake.isRunning());
        fake.advanceBy(100_000);
        assertEquals(6, events.all.size());
    }

    @Test
    public void keepsWhatASessionWouldRecordFrom() {
        assertNull(fake.getSessionRecording());
        start(spoken().results(GO).build());
        assertNull(fake.getSessionRecording().getInput());
        final RecordingOptions own =
                RecordingOptions.ofInput(
                        (rate, length, mode) -> {
                            throw new AssertionError("the input is opened");
                        });
        engine.createRecognizer(NOTHING, own, events, DIRECT).start();
        assertSame(own, fake.getSessionRecording());
    }

    @Test
    public void theClockShowsTheTimeOfEachEvent() {
        final List<Long> times = new ArrayList<>();
        fake.play(spoken().results(GO).build());
        engine.createRecognizer(
                        NOTHING,
                        new HeardEvents() {
                            @Override
                            void meanwhile(String event) {
                                times.add(fake.getTimeMs());
                            }
                        })
                .start();
        fake.advanceBy(7000);
        assertEquals(List.of(300L, 400L, 400L, 500L, 1500L, 1750L), times);
        assertEquals(7000, fake.getTimeMs());
    }

    @Test
    public void noEventComesInsideACallUnlessTheExecutorRunsAtOnce() {
        final Script failing = Script.cloud().error(SpeechError.NETWORK).build();
        start(failing);
        assertHeard();
        fake.advanceBy(0);
        assertHeard("error NETWORK: unknown cause");
        fake.play(failing);
        engine.createRecognizer(NOTHING, events, DIRECT).start();
        assertEquals(2, events.all.size());
    }

    @Test
    public void stopEndsListeningAndTheAnswerFollows() {
        final TalvoxRecognizer recognizer = start(spoken().results(GO).build());
        fake.advanceBy(450);
        recognizer.stop();
        recognizer.stop();
        fake.advanceBy(249);
        assertHeard("recordingBegin", "level 40.0", "buffer 3200", "recordingDone");
        fake.advanceBy(1);
        assertEquals(RESULTS, events.all.get(4));
        recognizer.stop();
        fake.advanceBy(60_000);
        assertEquals(5, events.all.size());
    }

    @Test
    public void stopAfterTheEndOfListeningChangesNothing() {
        final TalvoxRecognizer recognizer = start(spoken().results(GO).build());
        fake.advanceBy(1600);
        recognizer.stop();
        fake.advanceBy(149);
        assertEquals("recordingDone", events.all.get(events.all.size() - 1));
        fake.advanceBy(1);
        assertEquals(RESULTS, events.all.get(events.all.size() - 1));
    }

    @Test
    public void stopBeforeAnySoundIsAnError() {
        start(spoken().results(GO).build()).stop();
        fake.advanceBy(0);
        assertHeard("error AUDIO: no sound was recorded");
        events.all.clear();
        final TalvoxRecognizer recognizer = start(spoken().results(GO).build());
        fake.advanceBy(100);
        recognizer.stop();
        fake.finish();
        assertHeard("recordingDone", RESULTS);
    }

    @Test
    public void anAnswerBeforeTheEndOfListeningFollowsAStopAtOnce() {
        final TalvoxRecognizer recognizer =
                start(Script.cloud().after(300).recordingBegin().after(900).results(GO).build());
        fake.advanceBy(500);
        recognizer.stop();
        fake.advanceBy(0);
        assertHeard("recordingBegin", "recordingDone", RESULTS);
    }

    @Test
    public void silenceThatIsStoppedGivesEmptyResults() {
        final TalvoxRecognizer recognizer = start(Script.cloud().build());
        fake.advanceBy(4999);
        recognizer.stop();
        fake.advanceBy(0);
        assertHeard("recordingDone", "results []");
    }

    @Test
    public void silenceEndsByItself() {
        start(Script.cloud().build());
        fake.advanceBy(5000);
        assertHeard("error NO_VOICE: no speech within 5 s");
    }

    @Test
    public void cancelIsTheEnd() {
        final TalvoxRecognizer recognizer = start(spoken().results(GO).build());
        fake.advanceBy(300);
        recognizer.cancel();
        recognizer.cancel();
        fake.advanceBy(60_000);
        assertHeard("recordingBegin", "error CANCELED: the application cancelled");
    }

    @Test
    public void closeIsSilent() {
        final TalvoxRecognizer recognizer = start(spoken().results(GO).build());
        fake.advanceBy(300);
        recognizer.close();
        assertFalse(fake.isRunning());
        fake.advanceBy(60_000);
        assertHeard("recordingBegin");
        assertThrows(IllegalStateException.class, recognizer::stop);
    }

    @Test
    public void aSecondSessionIsBusyAndCostsNoScript() {
        start(spoken().results(GO).build());
        final HeardEvents second = new HeardEvents();
        final TalvoxRecognizer refused = engine.createRecognizer(NOTHING, second);
        refused.start();
        refused.cancel();
        fake.finish();
        assertEquals(List.of("error BUSY: another session is active"), second.all);
        assertEquals(6, events.all.size());
        assertEquals(2, fake.getStartCount());
    }

    @Test
    public void theNextSessionMayStartInsideTheEnd() {
        for (Executor executor : new Executor[] {DIRECT, null}) {
            fake.play(spoken().results(GO).build()).play(spoken().error(SpeechError.NETWORK).build());
            events.all.clear();
            final HeardEvents first =
                    new HeardEvents() {
                        @Override
                        void meanwhile(String event) {
                            if (event.equals(RESULTS)) {
                                FakeEngineTest.this.start();
                            }
                        }
                    };
            final TalvoxRecognizer recognizer =
                    executor == null
                            ? engine.createRecognizer(NOTHING, first)
                            : engine.createRecognizer(NOTHING, first, executor);
            recognizer.start();
            fake.advanceBy(3499);
            assertEquals(5, events.all.size());
            fake.advanceBy(1);
            assertEquals("error NETWORK: unknown cause", events.all.get(5));
        }
    }

    @Test
    public void aSessionWithoutAScriptFailsTheTest() {
        final AssertionError failure = assertThrows(AssertionError.class, this::start);
        assertEquals("no script is left for session 1", failure.getMessage());
    }

    @Test
    public void theRecognizersRulesHold() {
        final TalvoxRecognizer recognizer = start(spoken().build());
        assertThrows(IllegalStateException.class, recognizer::start);
        assertThrows(
                IllegalArgumentException.class,
                () ->
                        engine.createRecognizer(
                                TalvoxSettings.builder()
                                        .set(TalvoxSettings.STREAMING, true)
                                        .build(),
                                events));
        recognizer.cancel();
        assertEquals("the application cancelled", recognizer.getErrorReason());
    }

    @Test
    public void settingsAreThoseThatWereSet() {
        assertNull(engine.getSettings().get(TalvoxSettings.LANGUAGE));
        engine.updateSettings(
                TalvoxSettings.builder()
                        .set(TalvoxSettings.LANGUAGE, "en-US")
                        .set(TalvoxSettings.VERBOSITY, 2)
                        .build());
        engine.updateSettings(
                TalvoxSettings.builder().set(TalvoxSettings.LANGUAGE, "tr-TR").build());
        assertEquals("tr-TR", engine.getSettings().get(TalvoxSettings.LANGUAGE));
        assertEquals((Integer) 2, engine.getSettings().get(TalvoxSettings.VERBOSITY));
        engine.updateSettingsFromXml("<startup/>");
        assertEquals(List.of("<startup/>"), fake.getXmlDocuments());
    }

    @Test
    public void languagesAndAvailabilityAreTheTests() {
        fake.setAvailableLanguages("tr-TR", "en-US", "tr-TR");
        assertEquals(List.of("en-US", "tr-TR"), engine.getAvailableLanguages());
        assertTrue(engine.isRecognitionAvailable(NOTHING));
        fake.setRecognitionAvailable(false);
        assertFalse(engine.isRecognitionAvailable(NOTHING));
    }

    @Test
    public void anInstalledEngineIsTheApplicationsOwn() {
        fake.install();
        assertSame(engine, TalvoxEngine.getInstance(new ContextWrapper(null)));
        assertEquals(
                "context",
                assertThrows(NullPointerException.class, () -> TalvoxEngine.getInstance(null))
                        .getMessage());
    }

    @Test
    public void theClockIsNotMovedFromInsideAnEvent() {
        fake.play(spoken().results(GO).build());
        final List<String> refusals = new ArrayList<>();
        engine.createRecognizer(
                        NOTHING,
                        new HeardEvents() {
                            @Override
                            void meanwhile(String event) {
                                refusals.add(
                                        assertThrows(
                                                        IllegalStateException.class,
                                                        () -> fake.advanceBy(1))
                                                .getMessage());
                            }
                        })
                .start();
        fake.advanceBy(300);
        assertEquals(List.of("advanceBy: called from inside an event"), refusals);
        assertThrows(IllegalArgumentException.class, () -> fake.advanceBy(-1));
    }

    /** Whatever is called when, a session ends once, and nothing comes after its end. */
    @Test
    public void everySessionEndsOnceUnderRandomCalls() {
        for (int seed = 0; seed < 2000; seed++) {
            final Random random = new Random(seed);
            final Script script =
                    random.nextBoolean() ? spoken().results(GO).build() : spoken().build();
            fake.play(script);
            final HeardEvents heard = new HeardEvents();
            final TalvoxRecognizer recognizer =
                    random.nextBoolean()
                            ? engine.createRecognizer(NOTHING, heard)
                            : engine.createRecognizer(NOTHING, heard, DIRECT);
            recognizer.start();
            for (int step = random.nextInt(4); step > 0; step--) {
                fake.advanceBy(random.nextInt(1000));
                if (random.nextInt(3) == 0) {
                    recognizer.cancel();
                } else {
                    recognizer.stop();
                }
            }
            fake.advanceBy(60_000);
            final long ends =
                    heard.all.stream()
                            .filter(event -> event.matches("(results|error).*"))
                            .count();
            assertEquals("seed " + seed + ": " + heard.all, 1, ends);
            assertTrue(
                    "seed " + seed + ": " + heard.all,
                    heard.all.get(heard.all.size() - 1).matches("(results|error).*"));
            assertTrue(
                    "seed " + seed + ": " + heard.all,
                    heard.all.stream().filter("recordingDone"::equals).count() <= 1);
            recognizer.close();
            assertFalse(fake.isRunning());
        }
    }
}
