package korvel.talvox.impl;

import android.os.Bundle;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.HashSet;
import java.util.Set;

/** A device recognizer that does as it is bidden. */
public final class PlatformRecognizer {
    /** Names of methods that throw, "new" for the constructor. */
    public static final Set<String> THROWING = new HashSet<>();

    /** The calls so far, except for those that throw. */
    public static final StringBuilder CALLS = new StringBuilder();

    public static Object[] languages = {};

    /** The recognizer that native code made last. */
    public static long newest;

    PlatformRecognizer(long recognizer, Bundle settings) {
        newest = recognizer;
        call("new");
    }

    private static void call(String name) {
        if (THROWING.contains(name)) {
            throw new IllegalArgumentException(name + " throws");
        }
        CALLS.append(name).append(' ');
    }

    void start() {
        call("start");
    }

    void stop() {
        call("stop");
    }

    void cancel() {
        call("cancel");
    }

    String getModel() {
        call("getModel");
        return "model";
    }

    String getLanguagePreference() {
        call("getLanguagePreference");
        return null;
    }

    String getSource() {
        call("getSource");
        return "source";
    }

    @SuppressWarnings("unchecked")
    static ArrayList<String> getAvailableLanguages() {
        call("getAvailableLanguages");
        return (ArrayList<String>) (ArrayList<?>) new ArrayList<>(Arrays.asList(languages));
    }

    public static native void onReadyForSpeechInternal(long recognizer);

    public static native void onBeginningOfSpeechInternal(long recognizer);

    public static native void onRmsChangedInternal(long recognizer, float rms);

    public static native void onBufferReceivedInternal(long recognizer, byte[] sound);

    public static native void onEndOfSpeechInternal(long recognizer);

    public static native void onPartialResultsInternal(
            long recognizer, String[] texts, float[] scores);

    public static native void onResultsInternal(long recognizer, String[] texts, float[] scores);

    public static native void onErrorInternal(long recognizer, int code);

    public static native void onEventInternal(long recognizer, int type, Bundle parameters);
}
