package korvel.core;

import android.media.AudioDeviceInfo;
import android.util.Log;
import java.io.IOException;
import java.util.Arrays;
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

    /** How far ahead of real time an input is read: a session takes its times from the clock. */
    private static final int LEAD_MS = 100;

    private static final String TAG = "Talvox";
    private static final SoundInput.Factory MICROPHONE = microphone(null, null);
    private static volatile SoundInput.Factory factory = MICROPHONE;

    /** The thread of the newest recording. */
    private static @Nullable Thread newest;

    private final long recorder;
    private final int sampleRateHz;
    private final int bufferLengthMs;
    private final int mode;
    private final SessionRecording recording = SessionRecording.ofStart();
    private volatile boolean isStopped;

    private AudioRecorderBackend(long recorder, int sampleRateHz, int bufferLengthMs, int mode) {
        this.recorder = recorder;
        this.sampleRateHz = sampleRateHz;
        this.bufferLengthMs = bufferLengthMs;
        this.mode = mode;
    }

    /**
     * Records from something else than the microphone, also outside Android: for tests and tools.
     * The native library must be loaded. Any thread; concerns recordings that start from now on, but
     * for those of recognitions with an input of their own.
     *
     * @param inputs opens what is recorded from; null for the microphone
     */
    public static void setInputFactory(SoundInput.@Nullable Factory inputs) {
        factory = inputs != null ? inputs : MICROPHONE;
        installInternal();
    }

    /**
     * What opens the device's microphone.
     *
     * @param audioSource one of {@link android.media.MediaRecorder.AudioSource}; null for that of the
     *     session's mode
     * @param device the preferred one; null for the system's choice
     */
    public static SoundInput.Factory microphone(
            @Nullable Integer audioSource, @Nullable AudioDeviceInfo device) {
        return (sampleRateHz, bufferLengthMs, mode) ->
                Microphone.open(
                        sampleRateHz,
                        bufferLengthMs,
                        audioSource != null ? audioSource : Microphone.getSource(mode),
                        device);
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
        reach(SessionRecording.State.OPENING);
        try {
            if (previous != null) {
                previous.join(PREVIOUS_WAIT_MS);
            }
            if (!isStopped) {
                record();
            }
        } catch (InterruptedException interrupted) {
            Thread.currentThread().interrupt();
        } catch (IOException | RuntimeException | Error failure) {
            // An input is the application's code. Whatever it throws must not end the process.
            report(failure);
        }
    }

    private void record() throws IOException, InterruptedException {
        final int pieceMs = Math.min(PIECE_MS, bufferLengthMs);
        final byte[] piece =
                new byte[Math.max(1, sampleRateHz * pieceMs / MS_PER_SECOND) * BYTES_PER_SAMPLE];
        final SoundInput.Factory own = recording.getInputs();
        final SoundInput input =
                (own != null ? own : factory).open(sampleRateHz, bufferLengthMs, mode);
        if (input == null) {
            throw new IOException("the factory of the sound input returned null");
        }
        final Pace pace = new Pace(sampleRateHz * BYTES_PER_SAMPLE);
        try {
            read(input, piece, pace);
        } finally {
            close(input);
        }
        deliverSilence(piece, pace);
    }

    /** Reads until the sound ends or the recording is stopped. */
    private void read(SoundInput input, byte[] piece, Pace pace)
            throws IOException, InterruptedException {
        final SoundWatch watch = new SoundWatch(sampleRateHz * BYTES_PER_SAMPLE);
        final WholeSamples samples = new WholeSamples(piece.length);
        reach(SessionRecording.State.RECORDING);
        while (!isStopped) {
            final int size = input.read(piece, piece.length);
            if (size <= 0) {
                reach(SessionRecording.State.ENDED);
                return;
            }
            if (size > piece.length) {
                throw new IOException(
                        "the sound input returned " + size + " bytes for " + piece.length);
            }
            final int whole = samples.join(piece, size);
            reach(watch.look(samples.getBytes(), whole, isSilenced(input)));
            deliver(samples.getBytes(), whole);
            if (!(input instanceof Microphone)) {
                pace.waitUnlessDue(whole, LEAD_MS);
            }
        }
    }

    private static boolean isSilenced(SoundInput input) {
        return input instanceof Microphone && ((Microphone) input).isSilenced();
    }

    /**
     * Follows the end of the sound: without it, native code would take the device for broken. Not
     * every sample is zero, or the log would have a muted microphone.
     */
    private void deliverSilence(byte[] piece, Pace pace) throws InterruptedException {
        Arrays.fill(piece, (byte) 0);
        piece[0] = 1;
        while (!isStopped) {
            deliver(piece, piece.length);
            pace.waitUnlessDue(piece.length, LEAD_MS);
        }
    }

    private void deliver(byte[] sound, int size) {
        if (!isStopped) {
            onDataInternal(recorder, sound, size);
        }
    }

    private static void close(SoundInput input) {
        try {
            input.close();
        } catch (IOException | RuntimeException | Error failure) {
            Log.w(TAG, "closing the sound input failed", failure);
        }
    }

    /** A stop leaves the state as it is: it says what the recorder had reached by then. */
    private void reach(SessionRecording.State state) {
        if (!isStopped) {
            recording.reach(state);
        }
    }

    private void report(Throwable failure) {
        if (!isStopped) {
            final String why = Objects.toString(failure.getMessage(), failure.toString());
            recording.fail(RecordingException.getState(failure), why);
            onErrorInternal(recorder, why);
        }
    }

    private static native void installInternal();

    private static native void onDataInternal(long recorder, byte[] data, int sizeInBytes);

    private static native void onErrorInternal(long recorder, String reason);
}
