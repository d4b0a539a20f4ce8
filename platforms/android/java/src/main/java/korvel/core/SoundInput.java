package korvel.core;

import java.io.Closeable;
import java.io.IOException;

/**
 * A source of 16-bit mono sound in the machine's byte order: a file, a capture of the application's
 * own, the stream of another application. One recognition opens it, reads it and closes it, all on a
 * thread of its own, which may be blocked.
 *
 * <p>What the engine does with an input that breaks these rules:
 *
 * <table>
 *   <caption>Outcomes</caption>
 *   <tr><th>the input</th><th>outcome</th></tr>
 *   <tr><td>returns an odd number of bytes</td>
 *       <td>half a sample waits for its other half, the first byte of the next read</td></tr>
 *   <tr><td>returns 0 or less</td>
 *       <td>the sound has ended, also when nothing came before. The input is closed and not read
 *       again. The recognition hears silence from then on, as when a speaker stops</td></tr>
 *   <tr><td>returns more than it was asked for</td><td>an error of the sound</td></tr>
 *   <tr><td>delivers faster than real time, as a file does</td>
 *       <td>it is read at the pace of real time</td></tr>
 *   <tr><td>delivers slower than real time, or hangs</td>
 *       <td>an error of the sound after five seconds without any, or one once it has begun</td></tr>
 *   <tr><td>throws, whatever it is</td><td>an error of the sound with the message</td></tr>
 *   <tr><td>throws from {@code close}</td><td>a line in the log</td></tr>
 *   <tr><td>writes into the buffer after {@code read} has returned, from another thread</td>
 *       <td>the sound may change; nothing else does</td></tr>
 *   <tr><td>serves two recognitions</td>
 *       <td>the second one reads when the first has closed it, or after two seconds</td></tr>
 * </table>
 *
 * <p>An error of the sound is {@code SpeechError.AUDIO}; the detail has the reason.
 */
public interface SoundInput extends Closeable {
    /**
     * Reads sound; blocks until there is some.
     *
     * @param buffer where it goes, from the beginning
     * @param sizeInBytes the most to read, even
     * @return how many bytes were read; 0 or less when the sound has ended
     * @throws IOException with the reason, for developers, when there will be no more
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
         * @throws IOException with the reason, for developers
         */
        SoundInput open(int sampleRateHz, int bufferLengthMs, int mode) throws IOException;
    }
}
