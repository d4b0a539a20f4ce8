package korvel.core;

import android.Manifest;
import android.content.Context;
import android.content.pm.PackageManager;
import android.media.AudioDeviceInfo;
import android.media.AudioFormat;
import android.media.AudioManager;
import android.media.AudioRecord;
import android.media.AudioRecordingConfiguration;
import android.media.MediaRecorder;
import android.os.Build;
import android.util.Log;
import java.io.IOException;
import korvel.core.SessionRecording.State;
import org.jspecify.annotations.Nullable;

/** The device's microphone. */
final class Microphone implements SoundInput {
    private static final int MODE_VOICE_RECOGNITION = 1;
    private static final int BYTES_PER_SAMPLE = 2;
    private static final int MS_PER_SECOND = 1000;

    /** How many of the reader's buffers the system may hold for it. */
    private static final int BUFFERS = 8;

    /** How much sound comes between two looks at permission and system. */
    private static final int CHECK_MS = 200;

    private static final String TAG = "Talvox";

    private final AudioRecord record;
    private final int bytesPerCheck;
    private int uncheckedBytes;
    private boolean silenced;

    private Microphone(AudioRecord record, int sampleRateHz) {
        this.record = record;
        bytesPerCheck = sampleRateHz * BYTES_PER_SAMPLE * CHECK_MS / MS_PER_SECOND;
        uncheckedBytes = bytesPerCheck;
    }

    static SoundInput open(
            int sampleRateHz, int bufferLengthMs, int source, @Nullable AudioDeviceInfo device)
            throws IOException {
        checkPermission("the application lacks the permission RECORD_AUDIO");
        final AudioRecord record;
        try {
            record =
                    new AudioRecord(
                            source,
                            sampleRateHz,
                            AudioFormat.CHANNEL_IN_MONO,
                            AudioFormat.ENCODING_PCM_16BIT,
                            getBufferSize(sampleRateHz, bufferLengthMs));
        } catch (IllegalArgumentException refused) {
            throw new RecordingException(
                    State.UNAVAILABLE,
                    "no recording at " + sampleRateHz + " Hz from audio source " + source,
                    refused);
        }
        try {
            if (record.getState() != AudioRecord.STATE_INITIALIZED) {
                throw new RecordingException(State.UNAVAILABLE, "the microphone cannot be opened");
            }
            if (device != null && !record.setPreferredDevice(device)) {
                Log.w(TAG, "the preferred device is refused; the system chooses one");
            }
            record.startRecording();
            if (record.getRecordingState() != AudioRecord.RECORDSTATE_RECORDING) {
                throw new RecordingException(
                        State.IN_USE, "the microphone is in use by another application");
            }
            return new Microphone(record, sampleRateHz);
        } catch (IllegalStateException refused) {
            record.release();
            throw new RecordingException(
                    State.UNAVAILABLE, "the microphone cannot be started", refused);
        } catch (IOException refused) {
            record.release();
            throw refused;
        }
    }

    static int getSource(int mode) {
        return mode == MODE_VOICE_RECOGNITION
                ? MediaRecorder.AudioSource.VOICE_RECOGNITION
                : MediaRecorder.AudioSource.MIC;
    }

    private static void checkPermission(String refusal) throws IOException {
        final Context context = CoreApplication.getApplicationContext();
        if (context != null
                && context.checkSelfPermission(Manifest.permission.RECORD_AUDIO)
                        != PackageManager.PERMISSION_GRANTED) {
            throw new RecordingException(State.NO_PERMISSION, refusal);
        }
    }

    private static int getBufferSize(int sampleRateHz, int bufferLengthMs) {
        final int least =
                AudioRecord.getMinBufferSize(
                        sampleRateHz, AudioFormat.CHANNEL_IN_MONO, AudioFormat.ENCODING_PCM_16BIT);
        final long wanted =
                (long) BUFFERS * BYTES_PER_SAMPLE * sampleRateHz * bufferLengthMs / MS_PER_SECOND;
        return (int) Math.max(least, Math.min(wanted, Integer.MAX_VALUE / 2));
    }

    @Override
    public int read(byte[] buffer, int sizeInBytes) throws IOException {
        final int size = record.read(buffer, 0, sizeInBytes);
        uncheckedBytes += Math.max(0, size);
        if (size <= 0 || uncheckedBytes >= bytesPerCheck) {
            uncheckedBytes = 0;
            checkPermission("the permission RECORD_AUDIO was withdrawn during the recording");
            silenced = findSilenced();
        }
        if (size == 0) {
            throw new RecordingException(State.ENDED, "the microphone delivers no more");
        }
        if (size < 0) {
            throw new IOException(describe(size));
        }
        return size;
    }

    /** Whether the system delivered silence in place of the sound when it was last asked. */
    boolean isSilenced() {
        return silenced;
    }

    /** Systems before 10 do not say. */
    private boolean findSilenced() {
        final Context context = CoreApplication.getApplicationContext();
        if (context == null || Build.VERSION.SDK_INT < Build.VERSION_CODES.Q) {
            return false;
        }
        final AudioManager manager = context.getSystemService(AudioManager.class);
        if (manager == null) {
            return false;
        }
        for (AudioRecordingConfiguration active : manager.getActiveRecordingConfigurations()) {
            if (active.getClientAudioSessionId() == record.getAudioSessionId()) {
                return active.isClientSilenced();
            }
        }
        return false;
    }

    private static String describe(int error) {
        switch (error) {
            case AudioRecord.ERROR_DEAD_OBJECT:
                return "the audio service has died (dead object)";
            case AudioRecord.ERROR_INVALID_OPERATION:
                return "the microphone does not record (invalid operation)";
            case AudioRecord.ERROR_BAD_VALUE:
                return "the microphone refuses the buffer (bad value)";
            default:
                return "the microphone fails with error " + error;
        }
    }

    @Override
    public void close() {
        try {
            record.stop();
        } catch (IllegalStateException stopped) {
            // It had stopped by itself.
        }
        record.release();
    }
}
