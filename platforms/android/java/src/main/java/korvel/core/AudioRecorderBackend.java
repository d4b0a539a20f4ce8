package korvel.core;

import java.io.IOException;
import java.util.Objects;
import org.jspecify.annotations.Nullable;

/**
 * One recording of the native recorder: reads a {@link SoundInput} on a thread of its own and hands
 * the sound over. The native side makes, starts and stops it; neither waits for the device.
 */
public final class AudioRecorderBackend {
    private static final int PIECE_MS = 20;
    private static final int BYTES_PER_SAMPLE = 2;
    private static final int MS_PER_SECOND = 1000;

    /** How long a recording waits for the device that the one before it lets go of. */
    private static final long PREVIOUS_WAIT_MS = 2000;

    private static final SoundInput.Factory MICROPHONE = Microphone::open;
    private static volatile SoundInput.Factory factory = MICROPHONE;

    /** The thread of the newest recording. */
    private static @Nullable Thread newest;

    private final long recorder;
    private final int sampleRateHz;
    private final int bufferLengthMs;
    private final int mode;
    private final RecordingReport report = RecordingReport.ofStart();
    private volatile boolean isStopped;

    private AudioRecorderBackend(long recorder, int sampleRateHz, int bufferLengthMs, int mode) {
        this.recorder = recorder;
        this.sampleRateHz = sampleRateHz;
        this.bufferLengthMs = bufferLengthMs;
        this.mode = mode;
    }

    /**
     * Records from something else than the microphone, also outside Android: for tests and tools.
     * The native library must be loaded. Any thread; concerns recordings that start from now on.
     *
     * @param inputs opens what is recorded from; null for the microphone
     */
    public static void setInputFactory(SoundInput.@Nullable Factory inputs) {
        factory = inputs != null ? inputs : MICROPHONE;
        installInternal();
    }

    private void start() {
        synchronized (AudioRecorderBackend.class) {
            final Thread previous = newest;
            newest = new Thread(() -> run(previous), "talvox-recorder");
            newest.setDaemon(true);
            newest.start();
        }
    }

    private void stop() {
        isStopped = true;
    }

    private void run(@Nullable Thread previous) {
        reach(RecordingReport.State.OPENING);
        try {
            if (previous != null) {
                previous.join(PREVIOUS_WAIT_MS);
            }
            if (!isStopped) {
                record();
            }
        } catch (IOException | RuntimeException failure) {
            report(failure);
        } catch (InterruptedException interrupted) {
            Thread.currentThread().interrupt();
        }
    }

    private void record() throws IOException {
        final int pieceMs = Math.min(PIECE_MS, bufferLengthMs);
        final byte[] piece =
                new byte[Math.max(1, sampleRateHz * pieceMs / MS_PER_SECOND) * BYTES_PER_SAMPLE];
        try (SoundInput input = factory.open(sampleRateHz, bufferLengthMs, mode)) {
            reach(RecordingReport.State.RECORDING);
            while (!isStopped) {
                final int size = input.read(piece, piece.length);
                if (size <= 0) {
                    reach(RecordingReport.State.ENDED);
                    return;
                }
                if (!isStopped) {
                    onDataInternal(recorder, piece, size);
                }
            }
        }
    }

    /** A stop leaves the report as it is: it says what the recorder had reached by then. */
    private void reach(RecordingReport.State state) {
        if (!isStopped) {
            report.reach(state);
        }
    }

    private void report(Exception failure) {
        if (!isStopped) {
            final String why = Objects.toString(failure.getMessage(), failure.toString());
            report.fail(RecordingException.getState(failure), why);
            onErrorInternal(recorder, why);
        }
    }

    private static native void installInternal();

    private static native void onDataInternal(long recorder, byte[] data, int sizeInBytes);

    private static native void onErrorInternal(long recorder, String reason);
}
