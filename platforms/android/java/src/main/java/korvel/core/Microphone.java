package korvel.core;

import android.Manifest;
import android.content.Context;
import android.content.pm.PackageManager;
import android.media.AudioFormat;
import android.media.AudioRecord;
import android.media.MediaRecorder;
import java.io.IOException;
import korvel.core.RecordingReport.State;

/** The device's microphone. */
final class Microphone implements SoundInput {
    private static final int MODE_VOICE_RECOGNITION = 1;
    private static final int BYTES_PER_SAMPLE = 2;
    private static final int MS_PER_SECOND = 1000;

    /** How many of the reader's buffers the system may hold for it. */
    private static final int BUFFERS = 8;

    private final AudioRecord record;

    private Microphone(AudioRecord record) {
        this.record = record;
    }

    static SoundInput open(int sampleRateHz, int bufferLengthMs, int mode) throws IOException {
        checkPermission();
        final AudioRecord record;
        try {
            record =
                    new AudioRecord(
                            getSource(mode),
                            sampleRateHz,
                            AudioFormat.CHANNEL_IN_MONO,
                            AudioFormat.ENCODING_PCM_16BIT,
                            getBufferSize(sampleRateHz, bufferLengthMs));
        } catch (IllegalArgumentException refused) {
            throw new RecordingException(
                    State.UNAVAILABLE, "no recording at " + sampleRateHz + " Hz", refused);
        }
        try {
            if (record.getState() != AudioRecord.STATE_INITIALIZED) {
                throw new RecordingException(State.UNAVAILABLE, "the microphone cannot be opened");
            }
            record.startRecording();
            if (record.getRecordingState() != AudioRecord.RECORDSTATE_RECORDING) {
                throw new RecordingException(
                        State.IN_USE, "the microphone is in use by another application");
            }
            return new Microphone(record);
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

    private static void checkPermission() throws IOException {
        final Context context = CoreApplication.getApplicationContext();
        if (context != null
                && context.checkSelfPermission(Manifest.permission.RECORD_AUDIO)
                        != PackageManager.PERMISSION_GRANTED) {
            throw new RecordingException(
                    State.NO_PERMISSION, "the application lacks the permission RECORD_AUDIO");
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
        if (size < 0) {
            throw new IOException(describe(size));
        }
        return size;
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
