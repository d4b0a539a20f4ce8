package korvel.core;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import android.media.MediaRecorder;
import java.io.IOException;
import java.util.ArrayList;
import java.util.Collections;
import java.util.List;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.Semaphore;
import java.util.concurrent.atomic.AtomicInteger;
import korvel.talvox.SessionMode;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

/** Recording on a thread of its own, from an input that the test controls. */
public class RecorderTest extends EngineTestCase {
    private static final TalvoxSettings NOTHING = TalvoxSettings.builder().build();

    /** Delivers one piece for each permit; fails or ends when it is told to. */
    private static final class Input implements SoundInput {
        final Semaphore permits = new Semaphore(0);
        final CountDownLatch reading = new CountDownLatch(1);
        final CountDownLatch closed = new CountDownLatch(1);
        volatile IOException failure;
        volatile int lastSize;

        @Override
        public int read(byte[] buffer, int sizeInBytes) throws IOException {
            lastSize = sizeInBytes;
            reading.countDown();
            permits.acquireUninterruptibly();
            if (failure != null) {
                throw failure;
            }
            return sizeInBytes;
        }

        @Override
        public void close() {
            closed.countDown();
        }
    }

    private final Input input = new Input();
    private final List<String> openings = Collections.synchronizedList(new ArrayList<>());

    @Before
    public void plugIn() {
        Connectivity.wifi(application);
        useGateway("http://127.0.0.1:9/");
        AudioRecorderBackend.setInputFactory(
                (sampleRateHz, bufferLengthMs, mode) -> {
                    openings.add(sampleRateHz + " Hz, " + bufferLengthMs + " ms, mode " + mode);
                    return input;
                });
    }

    @After
    public void unplug() {
        input.permits.release(1 << 20);
        AudioRecorderBackend.setInputFactory(null);
    }

    @Test
    public void asksForTheRateTheBufferAndTheModeOfTheSettings() {
        engine.updateSettings(
                TalvoxSettings.builder()
                        .set(TalvoxSettings.SAMPLE_RATE, 8000)
                        .set(TalvoxSettings.SESSION_MODE, SessionMode.GENERAL)
                        .build());
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, new Events())) {
            recognizer.start();
            await(input.reading);
        }
        input.permits.release();
        await(input.closed);
        assertEquals(Collections.singletonList("8000 Hz, 100 ms, mode 0"), openings);
        assertEquals(2 * 8000 * 20 / 1000, input.lastSize);
    }

    @Test
    public void aDeviceThatFailsIsAnErrorOfTheSoundWithItsReasonInTheLog() throws Exception {
        input.failure = new IOException("the audio service has died (dead object)");
        input.permits.release();
        final Events events = new Events();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            recognizer.start();
            events.end();
        }
        assertEquals(SpeechError.AUDIO, events.getError());
        assertLogged("AudioRecordRecorder: the audio service has died (dead object)");
        await(input.closed);
    }

    @Test
    public void anInputThatThrowsIsAnErrorOfTheSound() throws Exception {
        AudioRecorderBackend.setInputFactory(
                (sampleRateHz, bufferLengthMs, mode) -> {
                    throw new IllegalStateException();
                });
        final Events events = new Events();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            recognizer.start();
            events.end();
        }
        assertEquals(SpeechError.AUDIO, events.getError());
        assertLogged("AudioRecordRecorder: java.lang.IllegalStateException");
    }

    @Test
    public void theNextRecordingWaitsForTheDeviceOfTheOneBefore() throws Exception {
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, new Events())) {
            recognizer.start();
            await(input.reading);
        }
        final CountDownLatch openedAgain = new CountDownLatch(1);
        final AtomicInteger openInputs = new AtomicInteger();
        AudioRecorderBackend.setInputFactory(
                (sampleRateHz, bufferLengthMs, mode) -> {
                    openInputs.set(input.closed.getCount() == 0 ? 1 : 2);
                    openedAgain.countDown();
                    return new Input();
                });
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, new Events())) {
            recognizer.start();
            input.permits.release();
            await(openedAgain);
        }
        assertEquals(1, openInputs.get());
    }

    @Test
    public void theMicrophoneIsThatOfVoiceRecognitionOrTheGeneralOne() {
        assertEquals(
                MediaRecorder.AudioSource.VOICE_RECOGNITION,
                Microphone.getSource(1));
        assertEquals(MediaRecorder.AudioSource.MIC, Microphone.getSource(0));
        assertTrue(openings.isEmpty());
    }
}
