package korvel.core;

import java.io.Closeable;
import java.io.IOException;

/**
 * A source of 16-bit mono sound in the machine's byte order, such as the microphone. Used by one
 * thread, which may be blocked.
 */
public interface SoundInput extends Closeable {
    /**
     * Reads sound; blocks until there is some.
     *
     * @param buffer where it goes, from the beginning
     * @param sizeInBytes the most to read, even
     * @return how many bytes were read, even; 0 ends the recording silently
     * @throws IOException with the reason, for the log, when there will be no more
     */
    int read(byte[] buffer, int sizeInBytes) throws IOException;

    /** Opens inputs. */
    interface Factory {
        /**
         * Opens an input; may block.
         *
         * @param sampleRateHz the rate of the sound to deliver
         * @param bufferLengthMs how much the reader takes at a time
         * @param mode 1 for voice recognition, 0 for general recording
         * @throws IOException with the reason, for the log
         */
        SoundInput open(int sampleRateHz, int bufferLengthMs, int mode) throws IOException;
    }
}
