package korvel.talvox.impl;

import android.os.Bundle;
import java.util.function.Consumer;

/** A recognition, as an application without the kit declares it. Its events become lines. */
public final class Recognizer {
    private final Bundle settings;
    private final Consumer<String> events;

    public Recognizer(Bundle settings, Consumer<String> events) {
        this.settings = settings;
        this.events = events;
    }

    public static native long start(long engine, Recognizer object);

    public static native void stop(long recognizer);

    public static native void cancel(long recognizer);

    public static native void releaseRecognizer(long recognizer);

    private void onRecordingBegin() {
        events.accept("onRecordingBegin");
    }

    private void onSpeakingBegin() {
        events.accept("onSpeakingBegin");
    }

    private void onRecordingDone() {
        events.accept("onRecordingDone");
    }

    private void onPowerChanged(float power) {
        events.accept("onPowerChanged " + power);
    }

    private void onBufferReceived(byte[] buffer) {
        events.accept("onBufferReceived " + buffer.length);
    }

    private void onError(int code) {
        events.accept("onError " + code);
    }

    private void onResults(int outcome, String[] texts, float[] confidences, String requestId) {
        final StringBuilder line = new StringBuilder("onResults ").append(texts.length);
        for (int index = 0; index < Math.min(texts.length, 3); index++) {
            line.append(' ').append(texts[index]).append('=').append(confidences[index]);
        }
        events.accept(line.toString());
    }
}
