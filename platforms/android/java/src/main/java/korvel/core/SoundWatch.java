package korvel.core;

import android.util.Log;
import korvel.core.SessionRecording.State;

/**
 * Tells a microphone that the system silences from one that delivers only zeros, and both from one
 * in a quiet room, which is never without noise. Used by one thread.
 */
final class SoundWatch {
    private static final String TAG = "Talvox";

    private final long zeroBytesMax;
    private long zeroBytes;
    private boolean wasSilenced;

    /**
     * @param bytesPerSecond more than a second of zeros is not the sound of a live microphone
     */
    SoundWatch(long bytesPerSecond) {
        zeroBytesMax = bytesPerSecond;
    }

    /** What the recording is like after its next piece. */
    State look(byte[] sound, int size, boolean isSilenced) {
        zeroBytes = isZero(sound, size) ? zeroBytes + size : 0;
        if (isSilenced != wasSilenced) {
            wasSilenced = isSilenced;
            Log.w(
                    TAG,
                    isSilenced
                            ? "the system silences the microphone"
                            : "the system silences the microphone no longer");
        }
        if (isSilenced) {
            return State.SILENCED;
        }
        return zeroBytes > zeroBytesMax ? State.ONLY_ZEROS : State.RECORDING;
    }

    private static boolean isZero(byte[] sound, int size) {
        for (int index = 0; index < size; index++) {
            if (sound[index] != 0) {
                return false;
            }
        }
        return true;
    }
}
