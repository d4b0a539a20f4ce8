package korvel.talvox.impl;

import android.os.Bundle;
import android.util.Log;
import korvel.talvox.SpeechError;
import org.jspecify.annotations.Nullable;

/**
 * The native side's partner in one recognition. Applications use {@link
 * korvel.talvox.TalvoxRecognizer}.
 *
 * <p>Native code reads the field {@code settings} and calls the {@code on...} methods under the
 * event lock; it keeps this object alive until the recognition is released.
 */
public final class Recognizer {
    /** Receives the events, under the event lock: it must not block. */
    public interface Events {
        void onRecordingBegin();

        void onSpeakingBegin();

        void onRecordingDone();

        void onPowerChanged(float power);

        void onBufferReceived(byte[] buffer);

        /**
         * Comes right before {@link #onError}.
         *
         * @param reason empty where the cause is not known
         * @param httpStatus of the gateway's answer, if it is the cause
         * @param deviceError the number that the device recognizer reported, if it did
         */
        void onErrorDetail(
                String reason, @Nullable Integer httpStatus, @Nullable Integer deviceError);

        void onError(int code);

        /** Where this has no memory for the results, {@link #onError} follows. */
        void onResults(int outcome, String[] texts, float[] confidences, String requestId);
    }

    private static final String TAG = "Talvox";

    static {
        NativeLibrary.load();
    }

    private final Bundle settings;
    private final Events events;

    private Recognizer(Bundle settings, Events events) {
        this.settings = settings;
        this.events = events;
    }

    /**
     * Starts a recognition. Events may arrive before this returns.
     *
     * @param engine from {@link Talvox#getHandle}
     * @param settings what differs from the engine's settings
     * @return the recognition; closing it ends it without a further event
     */
    public static NativeHandle start(long engine, Bundle settings, Events events) {
        return new NativeHandle(
                start(engine, new Recognizer(settings, events)), Recognizer::releaseRecognizer);
    }

    public static void stop(NativeHandle recognizer) {
        recognizer.use(Recognizer::stop);
    }

    public static void cancel(NativeHandle recognizer) {
        recognizer.use(Recognizer::cancel);
    }

    private static native long start(long engine, Recognizer object);

    private static native void stop(long recognizer);

    private static native void cancel(long recognizer);

    private static native void releaseRecognizer(long recognizer);

    private void onRecordingBegin() {
        events.onRecordingBegin();
    }

    private void onSpeakingBegin() {
        events.onSpeakingBegin();
    }

    private void onRecordingDone() {
        events.onRecordingDone();
    }

    private void onPowerChanged(float power) {
        events.onPowerChanged(power);
    }

    private void onBufferReceived(byte[] buffer) {
        events.onBufferReceived(buffer);
    }

    private void onErrorDetail(
            String reason, @Nullable Integer httpStatus, @Nullable Integer deviceError) {
        events.onErrorDetail(reason, httpStatus, deviceError);
    }

    private void onError(int code) {
        events.onError(code);
    }

    private void onResults(
            int outcome, String[] texts, float[] confidences, String requestId) {
        try {
            events.onResults(outcome, texts, confidences, requestId);
        } catch (OutOfMemoryError full) {
            Log.e(TAG, "no memory for " + texts.length + " hypotheses", full);
            events.onError(SpeechError.UNKNOWN.getCode());
        }
    }
}
