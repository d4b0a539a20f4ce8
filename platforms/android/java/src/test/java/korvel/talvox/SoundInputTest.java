package korvel.talvox;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.media.AudioDeviceInfo;
import android.media.MediaRecorder;
import java.io.IOException;
import java.util.Arrays;
import java.util.Collections;
import java.util.List;
import java.util.Set;
import java.util.concurrent.CopyOnWriteArrayList;
import java.util.concurrent.CopyOnWriteArraySet;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.TimeUnit;
import java.util.concurrent.atomic.AtomicInteger;
import java.util.concurrent.atomic.AtomicLong;
import korvel.core.AudioRecorderBackend;
import korvel.core.SoundInput;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.Microphone;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;
import org.robolectric.shadows.AudioDeviceInfoBuilder;
import org.robolectric.shadows.ShadowAudioRecord;

/** A recognition that records from what it is given, and what comes of inputs that break the rules. */
public class SoundInputTest extends EngineTestCase {
    private static final TalvoxSettings NOTHING = TalvoxSettings.forRecognition().build();
    private static final int BYTES_PER_SECOND = 32000;

    private final Details events = new Details();
    private RecordingGateway gateway;

    private static final class Details extends Events {
        volatile ErrorDetail detail;

        @Override
        public void onError(SpeechError error, ErrorDetail value) {
            detail = value;
            super.onError(error, value);
        }
    }

    /** Delivers a sound in pieces of certain sizes, over and over, and then nothing. */
    private static class Source implements SoundInput {
        final AtomicInteger readsAfterEnd = new AtomicInteger();
        final AtomicInteger closings = new AtomicInteger();
        final CountDownLatch closed = new CountDownLatch(1);
        private final byte[] sound;
        private final int[] sizes;
        private int position;
        private int turn;
        private boolean hasEnded;

        Source(byte[] sound, int... sizes) {
            this.sound = sound;
            this.sizes = sizes;
        }

        @Override
        public int read(byte[] buffer, int sizeInBytes) throws IOException {
            if (hasEnded) {
                readsAfterEnd.incrementAndGet();
            }
            final int wanted = Math.min(sizeInBytes, sizes[turn++ % sizes.length]);
            final int size = Math.min(wanted, sound.length - position);
            System.arraycopy(sound, position, buffer, 0, size);
            position += size;
            hasEnded = size == 0;
            return size;
        }

        @Override
        public void close() throws IOException {
            closings.incrementAndGet();
            closed.countDown();
        }
    }

    @Before
    public void connect() {
        Connectivity.wifi(application);
        gateway = new RecordingGateway(true);
        useGateway(gateway.getUrl());
    }

    @After
    public void disconnect() {
        gateway.close();
        AudioRecorderBackend.setInputFactory(null);
    }

    private void expectEnd(String error, RecordingOptions recording) throws InterruptedException {
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(NOTHING, recording, events, Runnable::run)) {
            recognizer.start();
            assertEquals("error " + error, events.end());
        }
    }

    private void cancelWhileRecording(RecordingOptions recording) throws InterruptedException {
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(NOTHING, recording, events, Runnable::run)) {
            recognizer.start();
            assertEquals("recordingBegin", events.next());
            recognizer.cancel();
            assertEquals("error CANCELED", events.end());
        }
        assertEquals(RecorderState.RECORDING, events.detail.getRecorderState());
    }

    private void expectFailure(String reason, SoundInput.Factory inputs)
            throws InterruptedException {
        expectEnd("AUDIO", RecordingOptions.ofInput(inputs));
        assertEquals("the recorder failed: " + reason, events.detail.getReason());
        assertEquals(RecorderState.FAILED, events.detail.getRecorderState());
    }

    /** Broken off inside a word, so that only the end of the sound can end the speech. */
    private static byte[] brokenOffSpeech() {
        return Arrays.copyOf(Microphone.recording("goforward.raw"), BYTES_PER_SECOND * 3 / 2);
    }

    @Test
    public void aSoundThatEndsIsRecognizedWhole() throws Exception {
        final byte[] sound = brokenOffSpeech();
        final Source source = new Source(sound, Integer.MAX_VALUE);
        expectEnd("NETWORK", RecordingOptions.ofInput((rate, length, mode) -> source));
        assertEquals(
                Arrays.asList("recordingBegin", "speakingBegin", "recordingDone", "error NETWORK"),
                events.getAll());
        assertEquals(RecorderState.ENDED, events.detail.getRecorderState());
        final byte[] sent = gateway.take().parts.get("audio");
        assertArrayEquals(sound, Arrays.copyOf(sent, sound.length));
        assertEquals(0, source.readsAfterEnd.get());
        assertEquals(1, source.closings.get());
    }

    @Test
    public void oddSizesLoseNoSample() throws Exception {
        final byte[] sound = brokenOffSpeech();
        final Source source = new Source(sound, 1, 319, 3, 2, 639);
        expectEnd("NETWORK", RecordingOptions.ofInput((rate, length, mode) -> source));
        final byte[] sent = gateway.take().parts.get("audio");
        assertArrayEquals(sound, Arrays.copyOf(sent, sound.length));
    }

    @Test
    public void nothingIsNoSpeech() throws Exception {
        final Source source = new Source(new byte[0], 1);
        expectEnd("NO_VOICE", RecordingOptions.ofInput((rate, length, mode) -> source));
        assertEquals("no speech within 5 s", events.detail.getReason());
        assertEquals(RecorderState.ENDED, events.detail.getRecorderState());
    }

    @Test
    public void moreThanWasAskedForIsAnError() throws Exception {
        expectFailure(
                "the sound input returned 642 bytes for 640",
                (rate, length, mode) ->
                        new Source(new byte[0], 1) {
                            @Override
                            public int read(byte[] buffer, int sizeInBytes) {
                                return sizeInBytes + 2;
                            }
                        });
    }

    @Test
    public void errorsOfTheInputEndTheSessionAndNotTheProcess() throws Exception {
        final Source source =
                new Source(new byte[0], 1) {
                    @Override
                    public int read(byte[] buffer, int sizeInBytes) {
                        throw new AssertionError("broken");
                    }
                };
        expectFailure("broken", (rate, length, mode) -> source);
        assertEquals(1, source.closings.get());
    }

    @Test
    public void noInputIsAnError() throws Exception {
        expectFailure(
                "the factory of the sound input returned null", (rate, length, mode) -> null);
    }

    @Test
    public void aCloseThatFailsIsLogged() throws Exception {
        final Source source =
                new Source(new byte[0], 1) {
                    @Override
                    public void close() throws IOException {
                        super.close();
                        throw new IOException("stuck");
                    }
                };
        expectEnd("NO_VOICE", RecordingOptions.ofInput((rate, length, mode) -> source));
        assertLogged("closing the sound input failed");
    }

    @Test
    public void anInputIsReadAtThePaceOfRealTime() throws Exception {
        final AtomicLong bytesRead = new AtomicLong();
        final long beginNs = System.nanoTime();
        expectEnd(
                "NO_VOICE",
                RecordingOptions.ofInput(
                        (rate, length, mode) ->
                                new Source(new byte[0], 1) {
                                    @Override
                                    public int read(byte[] buffer, int sizeInBytes) {
                                        buffer[0] ^= 1;
                                        bytesRead.addAndGet(sizeInBytes);
                                        return sizeInBytes;
                                    }
                                }));
        final double tookS = (System.nanoTime() - beginNs) / (double) TimeUnit.SECONDS.toNanos(1);
        final double readS = bytesRead.get() / (double) BYTES_PER_SECOND;
        assertTrue(readS + " s in " + tookS + " s", readS <= tookS + 0.2);
    }

    @Test
    public void aBufferThatAnotherThreadWritesDoesNoHarm() throws Exception {
        final CountDownLatch over = new CountDownLatch(1);
        final List<Thread> writers = new CopyOnWriteArrayList<>();
        final Source source =
                new Source(new byte[0], 1) {
                    @Override
                    public int read(byte[] buffer, int sizeInBytes) {
                        if (writers.isEmpty()) {
                            final Thread writer =
                                    new Thread(
                                            () -> {
                                                while (over.getCount() > 0) {
                                                    buffer[7] ^= 1;
                                                }
                                            });
                            writers.add(writer);
                            writer.start();
                        }
                        return sizeInBytes;
                    }
                };
        expectEnd("NO_VOICE", RecordingOptions.ofInput((rate, length, mode) -> source));
        over.countDown();
        writers.get(0).join();
    }

    @Test
    public void theNextRecognitionReadsAnInputWhenTheFirstHasClosedIt() throws Exception {
        final Source source =
                new Source(new byte[0], 1) {
                    @Override
                    public int read(byte[] buffer, int sizeInBytes) {
                        return sizeInBytes;
                    }
                };
        final AtomicInteger closingsAtSecondOpening = new AtomicInteger(-1);
        try (TalvoxRecognizer first =
                engine.createRecognizer(
                        NOTHING,
                        RecordingOptions.ofInput((rate, length, mode) -> source),
                        events,
                        Runnable::run)) {
            first.start();
            assertEquals("recordingBegin", events.next());
        }
        expectEnd(
                "NO_VOICE",
                RecordingOptions.ofInput(
                        (rate, length, mode) -> {
                            closingsAtSecondOpening.set(source.closings.get());
                            return source;
                        }));
        assertEquals(1, closingsAtSecondOpening.get());
        source.closed.await();
    }

    @Test
    public void theInputOfARecognitionIsItsOwn() throws Exception {
        AudioRecorderBackend.setInputFactory(
                (rate, length, mode) -> {
                    throw new IOException("that of all");
                });
        expectFailure(
                "its own",
                (rate, length, mode) -> {
                    throw new IOException("its own");
                });
        expectEnd("AUDIO", RecordingOptions.ofMicrophone());
        assertEquals("the recorder failed: that of all", events.detail.getReason());
    }

    @Test
    public void theMicrophoneHasTheSourceThatTheRecognitionAsksFor() throws Exception {
        final Set<Integer> sources = new CopyOnWriteArraySet<>();
        try (Microphone microphone = new Microphone(16000, 4)) {
            ShadowAudioRecord.setSourceProvider(
                    record -> {
                        sources.add(record.getAudioSource());
                        return microphone;
                    });
            cancelWhileRecording(
                    RecordingOptions.ofMicrophone()
                            .withAudioSource(MediaRecorder.AudioSource.CAMCORDER));
        }
        assertEquals(Collections.singleton(MediaRecorder.AudioSource.CAMCORDER), sources);
    }

    @Test
    public void aSourceThatTheDeviceDoesNotHaveIsUnavailable() throws Exception {
        expectEnd("AUDIO", RecordingOptions.ofMicrophone().withAudioSource(999));
        assertEquals(
                "the recorder failed: no recording at 16000 Hz from audio source 999",
                events.detail.getReason());
        assertEquals(RecorderState.UNAVAILABLE, events.detail.getRecorderState());
    }

    @Test
    public void aPreferredDeviceThatTheSystemRefusesIsLogged() throws Exception {
        final AudioDeviceInfo speaker =
                AudioDeviceInfoBuilder.newBuilder()
                        .setType(AudioDeviceInfo.TYPE_BUILTIN_SPEAKER)
                        .build();
        try (Microphone microphone = new Microphone(16000, 4).plugIn()) {
            cancelWhileRecording(RecordingOptions.ofMicrophone().withPreferredDevice(speaker));
        }
        assertLogged("the preferred device is refused; the system chooses one");
    }

    @Test
    public void optionsOfAMicrophoneAreNotThoseOfAnInput() {
        final RecordingOptions own = RecordingOptions.ofInput((rate, length, mode) -> null);
        assertEquals(
                "withAudioSource: the input is the application's own",
                assertThrows(IllegalStateException.class, () -> own.withAudioSource(1))
                        .getMessage());
    }
}
