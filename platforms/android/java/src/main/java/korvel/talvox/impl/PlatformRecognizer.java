package korvel.talvox.impl;

import android.Manifest;
import android.content.ComponentName;
import android.content.Context;
import android.content.Intent;
import android.content.pm.PackageManager;
import android.content.pm.ResolveInfo;
import android.os.Bundle;
import android.os.Handler;
import android.os.Looper;
import android.speech.RecognitionListener;
import android.speech.RecognitionService;
import android.speech.RecognizerIntent;
import android.speech.SpeechRecognizer;
import android.util.Log;
import java.util.ArrayList;
import java.util.List;
import korvel.core.CoreApplication;
import korvel.talvox.RecognitionModel;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxSettings;
import org.jspecify.annotations.Nullable;

/**
 * Drives the device recognizer for the native recognizer of the same name, which creates,
 * starts, stops and cancels this object and hears its callbacks.
 *
 * <p>{@link #start}, {@link #stop} and {@link #cancel} may be called on any thread, under the event
 * lock, and return at once: {@link SpeechRecognizer} is used on the main looper only.
 */
public final class PlatformRecognizer {
    private static final String TAG = "Talvox";
    private static final PlatformLanguages LANGUAGES = new PlatformLanguages();

    static {
        NativeLibrary.load();
    }

    private final long recognizer;
    private final String language;
    private final String model;
    private final Handler main = new Handler(Looper.getMainLooper());
    private volatile String source = "";
    private volatile boolean over;

    /** Of the main looper. */
    private @Nullable SpeechRecognizer speech;

    /** Called by native code. */
    PlatformRecognizer(long recognizer, Bundle settings) {
        this.recognizer = recognizer;
        final TalvoxSettings values = TalvoxSettings.fromBundle(settings);
        final String wanted = values.get(TalvoxSettings.LANGUAGE);
        language = wanted == null || wanted.isEmpty() ? LANGUAGES.getPreference() : wanted;
        model =
                values.get(TalvoxSettings.MODEL) == RecognitionModel.GENERAL
                        ? RecognizerIntent.LANGUAGE_MODEL_FREE_FORM
                        : RecognizerIntent.LANGUAGE_MODEL_WEB_SEARCH;
    }

    /** The kind of language model that the device recognizer was asked for. */
    String getModel() {
        return model;
    }

    /** The language that the device recognizer was asked for, empty for its own choice. */
    String getLanguagePreference() {
        return language;
    }

    /** The package of the device recognizer, empty if the device does not say. */
    String getSource() {
        return source;
    }

    /** Asks the device for its languages, for {@link #getAvailableLanguages} to have them later. */
    public static void queryLanguages() {
        final Context context = CoreApplication.getApplicationContext();
        if (context != null) {
            LANGUAGES.query(context);
        }
    }

    /** The languages that are known by now. Does not wait for the device, but asks it if needed. */
    public static ArrayList<String> getAvailableLanguages() {
        queryLanguages();
        return LANGUAGES.get();
    }

    /**
     * Begins to listen.
     *
     * @throws IllegalStateException if there is no application or it has no recognizer
     */
    void start() {
        final Context context = CoreApplication.getApplicationContext();
        if (context == null) {
            throw new IllegalStateException("there is no application context");
        }
        if (!SpeechRecognizer.isRecognitionAvailable(context)) {
            throw new IllegalStateException("the device has no speech recognizer");
        }
        source = findSource(context);
        main.post(() -> startListening(context));
    }

    /** Ends listening; results follow. */
    void stop() {
        main.post(
                () -> {
                    if (speech != null) {
                        speech.stopListening();
                    }
                });
    }

    /** Gives up; native code hears nothing more. */
    void cancel() {
        over = true;
        main.post(
                () -> {
                    if (speech != null) {
                        speech.cancel();
                        destroy();
                    }
                });
    }

    private void startListening(Context context) {
        if (over) {
            return;
        }
        if (context.checkSelfPermission(Manifest.permission.RECORD_AUDIO)
                != PackageManager.PERMISSION_GRANTED) {
            Log.e(TAG, "the application has no permission RECORD_AUDIO: nothing can be recorded");
            fail(
                    SpeechError.AUDIO.getCode(),
                    null,
                    "the application lacks the permission RECORD_AUDIO");
            return;
        }
        try {
            speech = SpeechRecognizer.createSpeechRecognizer(context);
            speech.setRecognitionListener(new Callbacks());
            speech.startListening(makeIntent(context));
        } catch (RuntimeException failure) {
            Log.e(TAG, "the device recognizer does not start", failure);
            fail(
                    SpeechError.NOT_AVAILABLE.getCode(),
                    null,
                    "the device recognizer does not start: " + failure);
        }
    }

    private Intent makeIntent(Context context) {
        final Intent intent = new Intent(RecognizerIntent.ACTION_RECOGNIZE_SPEECH);
        intent.putExtra(RecognizerIntent.EXTRA_LANGUAGE_MODEL, model);
        intent.putExtra(RecognizerIntent.EXTRA_CALLING_PACKAGE, context.getPackageName());
        intent.putExtra(RecognizerIntent.EXTRA_PARTIAL_RESULTS, true);
        if (!language.isEmpty()) {
            intent.putExtra(RecognizerIntent.EXTRA_LANGUAGE, language);
        }
        return intent;
    }

    private static String findSource(Context context) {
        final String chosen =
                android.provider.Settings.Secure.getString(
                        context.getContentResolver(), "voice_recognition_service");
        final ComponentName component =
                chosen == null ? null : ComponentName.unflattenFromString(chosen);
        if (component != null) {
            return component.getPackageName();
        }
        final List<ResolveInfo> services =
                context.getPackageManager()
                        .queryIntentServices(new Intent(RecognitionService.SERVICE_INTERFACE), 0);
        return services.isEmpty() || services.get(0).serviceInfo == null
                ? ""
                : services.get(0).serviceInfo.packageName;
    }

    private void destroy() {
        if (speech != null) {
            speech.destroy();
            speech = null;
        }
    }

    /** Hands a callback to native code, unless the session is over there. */
    private void report(Runnable callback) {
        if (over) {
            return;
        }
        try {
            callback.run();
        } catch (IllegalStateException stale) {
            // Another thread may have cancelled and released the session since the check.
            if (!over) {
                throw stale;
            }
        }
    }

    private void finish(Runnable lastCallback) {
        report(lastCallback);
        over = true;
        destroy();
    }

    /**
     * @param number what the device recognizer reported; null if the kit found the failure itself
     */
    private void fail(int code, @Nullable Integer number, String reason) {
        finish(
                () -> {
                    onErrorCauseInternal(recognizer, number, reason);
                    onErrorInternal(recognizer, code);
                });
    }

    /** What the platform calls, on the main looper. */
    private final class Callbacks implements RecognitionListener {
        @Override
        public void onReadyForSpeech(Bundle parameters) {
            report(() -> onReadyForSpeechInternal(recognizer));
        }

        @Override
        public void onBeginningOfSpeech() {
            report(() -> onBeginningOfSpeechInternal(recognizer));
        }

        @Override
        public void onRmsChanged(float rms) {
            report(() -> onRmsChangedInternal(recognizer, rms));
        }

        @Override
        public void onBufferReceived(byte @Nullable [] sound) {
            if (sound != null) {
                report(() -> onBufferReceivedInternal(recognizer, sound));
            }
        }

        @Override
        public void onEndOfSpeech() {
            report(() -> onEndOfSpeechInternal(recognizer));
        }

        @Override
        public void onPartialResults(@Nullable Bundle results) {
            final ReceivedBundle received = new ReceivedBundle(results);
            final ReceivedBundle.Texts texts = texts(received);
            final float @Nullable [] scores = scores(received, texts);
            report(() -> onPartialResultsInternal(recognizer, texts.toArray(), scores));
        }

        @Override
        public void onResults(@Nullable Bundle results) {
            final ReceivedBundle received = new ReceivedBundle(results);
            final ReceivedBundle.Texts texts = texts(received);
            final float @Nullable [] scores = scores(received, texts);
            texts.logOmitted();
            if (texts.toArray().length == 0) {
                finish(() -> onErrorInternal(recognizer, PlatformErrors.NO_HYPOTHESIS));
            } else {
                finish(() -> onResultsInternal(recognizer, texts.toArray(), scores));
            }
        }

        @Override
        public void onError(int error) {
            if (error == SpeechRecognizer.ERROR_INSUFFICIENT_PERMISSIONS) {
                Log.e(TAG, "the device recognizer was refused the permission RECORD_AUDIO");
            }
            fail(
                    PlatformErrors.toEngine(error),
                    error,
                    "the device recognizer reported " + PlatformErrors.describe(error));
        }

        @Override
        public void onEvent(int type, Bundle parameters) {
            report(() -> onEventInternal(recognizer, type, parameters));
        }
    }

    private static ReceivedBundle.Texts texts(ReceivedBundle results) {
        return results.getTexts(SpeechRecognizer.RESULTS_RECOGNITION);
    }

    private static float @Nullable [] scores(ReceivedBundle results, ReceivedBundle.Texts texts) {
        return texts.align(results.getFloats(SpeechRecognizer.CONFIDENCE_SCORES));
    }

    private static native void onReadyForSpeechInternal(long recognizer);

    private static native void onBeginningOfSpeechInternal(long recognizer);

    private static native void onRmsChangedInternal(long recognizer, float rms);

    private static native void onBufferReceivedInternal(long recognizer, byte[] sound);

    private static native void onEndOfSpeechInternal(long recognizer);

    private static native void onPartialResultsInternal(
            long recognizer, String[] texts, float @Nullable [] scores);

    private static native void onResultsInternal(
            long recognizer, String[] texts, float @Nullable [] scores);

    private static native void onErrorCauseInternal(
            long recognizer, @Nullable Integer number, String reason);

    private static native void onErrorInternal(long recognizer, int code);

    private static native void onEventInternal(long recognizer, int type, Bundle parameters);
}
