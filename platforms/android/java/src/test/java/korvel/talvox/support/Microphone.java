package korvel.talvox.support;

import java.io.IOException;
import java.io.UncheckedIOException;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.nio.file.Files;
import java.nio.file.Paths;
import java.util.Random;
import java.util.concurrent.Executors;
import java.util.concurrent.ScheduledExecutorService;
import java.util.concurrent.Semaphore;
import java.util.concurrent.TimeUnit;
import org.robolectric.shadows.ShadowAudioRecord;

/**
 * The microphone of a test: 16-bit mono, quiet noise until something is said and after it, at a
 * multiple of the speed of real time. A read waits until its samples are due, as that of a device
 * does.
 */
public final class Microphone implements ShadowAudioRecord.AudioRecordSource, AutoCloseable {
    private static final int TICK_MS = 10;
    private static final int TICKS_KEPT = 8;
    private static final int NOISE_AMPLITUDE = 8;

    private final Random noise = new Random(1);
    private final Semaphore due = new Semaphore(0);
    private final ScheduledExecutorService clock =
            Executors.newSingleThreadScheduledExecutor(
                    task -> {
                        final Thread thread = new Thread(task, "microphone");
                        thread.setDaemon(true);
                        return thread;
                    });
    private byte[] sound = new byte[0];
    private int position;

    /**
     * @param sampleRateHz of the sound
     * @param speed 1 for real time
     */
    public Microphone(int sampleRateHz, int speed) {
        final int bytesPerTick = 2 * sampleRateHz * TICK_MS * speed / 1000;
        clock.scheduleAtFixedRate(
                () -> {
                    // What nobody reads is lost, as with a device.
                    if (due.availablePermits() < TICKS_KEPT * bytesPerTick) {
                        due.release(bytesPerTick);
                    }
                },
                0,
                TICK_MS,
                TimeUnit.MILLISECONDS);
    }

    /** Opens it for the recordings that begin from now on. */
    public Microphone plugIn() {
        ShadowAudioRecord.setSource(this);
        return this;
    }

    /** Says something from now on. */
    public synchronized void say(byte[] what) {
        sound = what;
        position = 0;
    }

    /** A recording of 16 kHz from the test data. */
    public static byte[] recording(String name) {
        try {
            return Files.readAllBytes(Paths.get(System.getProperty("talvox.recordings"), name));
        } catch (IOException failure) {
            throw new UncheckedIOException(failure);
        }
    }

    private static void fill(byte[] target, int from, int size, Random noise) {
        final ByteBuffer samples =
                ByteBuffer.wrap(target, from, size).order(ByteOrder.LITTLE_ENDIAN);
        while (samples.remaining() >= 2) {
            samples.putShort((short) (noise.nextInt(2 * NOISE_AMPLITUDE + 1) - NOISE_AMPLITUDE));
        }
    }

    @Override
    public int readInByteArray(byte[] target, int offset, int size, boolean isBlocking) {
        if (isBlocking) {
            due.acquireUninterruptibly(size);
        } else if (!due.tryAcquire(size)) {
            return 0;
        }
        synchronized (this) {
            final int rest = Math.min(size, sound.length - position);
            System.arraycopy(sound, position, target, offset, rest);
            fill(target, offset + rest, size - rest, noise);
            position += rest;
        }
        return size;
    }

    @Override
    public int readInShortArray(short[] target, int offset, int size, boolean isBlocking) {
        final byte[] bytes = new byte[2 * size];
        final int read = readInByteArray(bytes, 0, bytes.length, isBlocking);
        ByteBuffer.wrap(bytes, 0, read)
                .order(ByteOrder.LITTLE_ENDIAN)
                .asShortBuffer()
                .get(target, offset, read / 2);
        return read / 2;
    }

    @Override
    public int readInDirectBuffer(ByteBuffer target, int size, boolean isBlocking) {
        final byte[] bytes = new byte[size];
        final int read = readInByteArray(bytes, 0, size, isBlocking);
        target.duplicate().put(bytes, 0, read);
        return read;
    }

    @Override
    public void close() {
        clock.shutdownNow();
        due.release(1 << 28); // a reader that is left gets noise at once
    }
}
