package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertTrue;
import static org.robolectric.Shadows.shadowOf;

import android.Manifest;
import java.io.IOException;
import java.util.Arrays;
import java.util.HashSet;
import java.util.Set;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.Executor;
import java.util.function.Consumer;
import korvel.core.AudioRecorderBackend;
import korvel.core.SessionRecording;
import korvel.core.SoundInput;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.DeviceRecognizer;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.Microphone;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

/** The detail beside an error: each value where it is known, and nowhere else. */
public class ErrorDetailTest extends EngineTestCase {
    private static final TalvoxSettings NOTHING = TalvoxSettings.forRecognition().build();
    private static final TalvoxSettings ON_DEVICE =
            TalvoxSettings.forRecognition()
                    .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_ONLY)
                    .build();

    /** Keeps the detail; the event itself comes by way of the method without it. */
    private static class Details extends Events {
        volatile ErrorDetail detail;

        @Override
        public void onError(SpeechError error, ErrorDetail value) {
            detail = value;
            super.onError(error, value);
        }
    }

    private final Details events = new Details();

    @Before
    public void join() {
        Connectivity.wifi(application);
    }

    @After
    public void unplug() {
        AudioRecorderBackend.setInputFactory(null);
    }

    private static void assertDetail(
            ErrorDetail detail,
            String reason,
            Integer httpStatus,
            Integer deviceError,
            RecorderState recorder) {
        assertEquals(new ErrorDetail(reason, httpStatus, deviceError, recorder), detail);
    }

    /** Runs a session whose error is expected; {@code meanwhile} happens once it has started. */
    private ErrorDetail fail(
            String error, TalvoxSettings settings, Consumer<TalvoxRecognizer> meanwhile)
            throws InterruptedException {
        try (TalvoxRecognizer recognizer = engine.createRecognizer(settings, events)) {
            recognizer.start();
            meanwhile.accept(recognizer);
            assertEquals("error " + error, events.end());
            assertEquals(recognizer.getErrorReason(), events.detail.getReason());
            return events.detail;
        }
    }

    private ErrorDetail failWith(SoundInput.Factory inputs, String error) throws Exception {
        useGateway("http://127.0.0.1:9/");
        AudioRecorderBackend.setInputFactory(inputs);
        return fail(error, NOTHING, recognizer -> {});
    }

    @Test
    public void theStatusOfTheAnswer() throws Exception {
        try (RecordingGateway gateway = new RecordingGateway(true)) {
            gateway.setStatus(404);
            final ErrorDetail detail = failAtGateway(gateway.getUrl());
            assertDetail(detail, "HTTP status 404", 404, null, RecorderState.RECORDING);
        }
    }

    private void nextIs(String event) {
        try {
            assertEquals(event, events.next());
        } catch (InterruptedException interrupted) {
            throw new AssertionError(interrupted);
        }
    }

    /** Records until the recording has begun, and stops; the answer brings the error. */
    private ErrorDetail failAtGateway(String url) throws Exception {
        useGateway(url);
        try (Microphone microphone = new Microphone(16000, 4).plugIn()) {
            return fail(
                    "NETWORK",
                    NOTHING,
                    recognizer -> {
                        nextIs("recordingBegin");
                        recognizer.stop();
                    });
        }
    }

    /** The kinds of failure between the device and the results that have no status. */
    private void assertNoAnswer(String url, String reason) throws Exception {
        final ErrorDetail detail = failAtGateway(url);
        assertTrue(detail.toString(), detail.getReason().startsWith(reason));
        assertDetail(detail, detail.getReason(), null, null, RecorderState.RECORDING);
    }

    @Test
    public void eachStatusIsTheNumberOfTheAnswer() throws Exception {
        try (RecordingGateway gateway = new RecordingGateway(true)) {
            gateway.setStatus(500);
            assertDetail(
                    failAtGateway(gateway.getUrl()),
                    "HTTP status 500",
                    500,
                    null,
                    RecorderState.RECORDING);
            gateway.setStatus(503);
            assertDetail(
                    failAtGateway(gateway.getUrl()),
                    "HTTP status 503 (the service is busy)",
                    503,
                    null,
                    RecorderState.RECORDING);
            gateway.setStatus(200);
            assertDetail(
                    failAtGateway(gateway.getUrl()),
                    "the answer holds no results (HTTP status 200)",
                    200,
                    null,
                    RecorderState.RECORDING);
        }
    }

    @Test
    public void aGatewayThatRefusesTheConnection() throws Exception {
        assertNoAnswer("http://127.0.0.1:9", "Failed to connect to 127.0.0.1 port 9");
    }

    @Test
    public void aNameThatNoServerKnows() throws Exception {
        assertNoAnswer("http://gateway.invalid", "Could not resolve host: gateway.invalid");
    }

    @Test
    public void noValueWithoutAnAnswerADeviceAndARecorder() throws Exception {
        forgetGateway();
        final ErrorDetail detail = fail("NETWORK", NOTHING, recognizer -> {});
        assertDetail(detail, "the engine's setting \"url\" is empty", null, null, null);
    }

    @Test
    public void theRecorderOfAnotherSessionIsNotNamed() throws Exception {
        useGateway("http://127.0.0.1:9/");
        try (Microphone microphone = new Microphone(16000, 4).plugIn();
                TalvoxRecognizer running = engine.createRecognizer(NOTHING, new Events())) {
            running.start();
            final ErrorDetail detail = fail("BUSY", NOTHING, recognizer -> {});
            assertDetail(detail, "another session is active", null, null, null);
        }
    }

    @Test
    public void theNumberOfTheDeviceRecognizer() throws Exception {
        DeviceRecognizer.install(application);
        ErrorDetail detail =
                fail(
                        "NETWORK",
                        ON_DEVICE,
                        recognizer -> DeviceRecognizer.callBack(device -> device.onError(1)));
        assertDetail(
                detail,
                "the device recognizer reported 1 (ERROR_NETWORK_TIMEOUT)",
                null,
                1,
                null);
        detail =
                fail(
                        "UNKNOWN",
                        ON_DEVICE,
                        recognizer -> DeviceRecognizer.callBack(device -> device.onError(99)));
        assertDetail(detail, "the device recognizer reported 99", null, 99, null);
    }

    @Test
    public void theNumberIsNotThatOfASessionWhichEndsInsideTheSameEvent() throws Exception {
        DeviceRecognizer.install(application);
        forgetGateway();
        final Details next = new Details();
        final TalvoxRecognizer other = engine.createRecognizer(NOTHING, next, Runnable::run);
        final Details first =
                new Details() {
                    @Override
                    public void onError(SpeechError error, ErrorDetail value) {
                        other.start();
                        super.onError(error, value);
                    }
                };
        final Executor direct = Runnable::run;
        try (TalvoxRecognizer recognizer = engine.createRecognizer(ON_DEVICE, first, direct)) {
            recognizer.start();
            DeviceRecognizer.callBack(device -> device.onError(4));
            assertEquals("error SERVER", first.end());
            assertEquals("error NETWORK", next.end());
        }
        other.close();
        assertEquals((Integer) 4, first.detail.getDeviceError());
        assertNull(next.detail.getDeviceError());
    }

    @Test
    public void aDeviceRecognizerWithoutPermission() throws Exception {
        DeviceRecognizer.install(application);
        shadowOf(application).denyPermissions(Manifest.permission.RECORD_AUDIO);
        final ErrorDetail detail = fail("AUDIO", ON_DEVICE, recognizer -> {});
        assertDetail(
                detail, "the application lacks the permission RECORD_AUDIO", null, null, null);
    }

    @Test
    public void aRecorderWithoutPermission() throws Exception {
        useGateway("http://127.0.0.1:9/");
        shadowOf(application).denyPermissions(Manifest.permission.RECORD_AUDIO);
        final ErrorDetail detail = fail("AUDIO", NOTHING, recognizer -> {});
        assertDetail(
                detail,
                "the recorder failed: the application lacks the permission RECORD_AUDIO",
                null,
                null,
                RecorderState.NO_PERMISSION);
    }

    @Test
    public void anInputThatFails() throws Exception {
        final ErrorDetail detail =
                failWith(
                        (sampleRateHz, bufferLengthMs, mode) -> {
                            throw new IOException("no such file");
                        },
                        "AUDIO");
        assertDetail(
                detail, "the recorder failed: no such file", null, null, RecorderState.FAILED);
    }

    @Test
    public void anInputThatHangsWhileItIsOpened() throws Exception {
        useGateway("http://127.0.0.1:9/");
        final CountDownLatch opening = new CountDownLatch(1);
        final CountDownLatch over = new CountDownLatch(1);
        AudioRecorderBackend.setInputFactory(
                (sampleRateHz, bufferLengthMs, mode) -> {
                    opening.countDown();
                    await(over);
                    throw new IOException("too late");
                });
        final ErrorDetail detail =
                fail(
                        "CANCELED",
                        NOTHING,
                        recognizer -> {
                            await(opening);
                            recognizer.cancel();
                        });
        over.countDown();
        assertDetail(
                detail, "the application cancelled", null, null, RecorderState.OPENING);
    }

    @Test
    public void anInputThatEnds() throws Exception {
        useGateway("http://127.0.0.1:9/");
        final CountDownLatch closed = new CountDownLatch(1);
        AudioRecorderBackend.setInputFactory(
                (sampleRateHz, bufferLengthMs, mode) ->
                        new SoundInput() {
                            @Override
                            public int read(byte[] buffer, int sizeInBytes) {
                                return 0;
                            }

                            @Override
                            public void close() {
                                closed.countDown();
                            }
                        });
        final ErrorDetail detail =
                fail(
                        "CANCELED",
                        NOTHING,
                        recognizer -> {
                            await(closed);
                            recognizer.cancel();
                        });
        assertDetail(detail, "the application cancelled", null, null, RecorderState.ENDED);
    }

    @Test
    public void everyStateOfTheRecorderHasItsOwnName() {
        final Set<RecorderState> named = new HashSet<>();
        for (SessionRecording.State state : SessionRecording.State.values()) {
            assertTrue(state.toString(), named.add(RecorderState.of(state)));
        }
        assertEquals(new HashSet<>(Arrays.asList(RecorderState.values())), named);
        assertNull(RecorderState.of(null));
    }

    @Test
    public void detailsAreValues() {
        final ErrorDetail detail = new ErrorDetail("broken", 500, 2, RecorderState.IN_USE);
        assertEquals("broken, HTTP status 500, device error 2, recorder IN_USE", detail.toString());
        assertEquals("unknown cause", new ErrorDetail("", null, null, null).toString());
        assertEquals(
                new ErrorDetail("broken", 500, 2, RecorderState.IN_USE).hashCode(),
                detail.hashCode());
        assertNotEquals(new ErrorDetail("", 500, 2, RecorderState.IN_USE), detail);
        assertNotEquals(new ErrorDetail("broken", null, 2, RecorderState.IN_USE), detail);
        assertNotEquals(new ErrorDetail("broken", 500, 3, RecorderState.IN_USE), detail);
        assertNotEquals(new ErrorDetail("broken", 500, 2, null), detail);
        assertNotEquals("broken", detail);
    }
}
