package korvel.talvox.support;

import static org.junit.Assert.assertNotNull;
import static org.robolectric.Shadows.shadowOf;

import android.app.Application;
import android.content.ComponentName;
import android.content.Intent;
import android.content.IntentFilter;
import android.os.Bundle;
import android.speech.RecognitionListener;
import android.speech.RecognitionService;
import android.speech.SpeechRecognizer;
import java.util.ArrayList;
import java.util.Arrays;
import org.robolectric.shadow.api.Shadow;
import org.robolectric.shadows.ShadowPackageManager;
import org.robolectric.shadows.ShadowSpeechRecognizer;
import org.robolectric.util.ReflectionHelpers;

/** The device recognizer, as a test plays it. */
public final class DeviceRecognizer {
    public static final String PACKAGE = "com.example.recognizer";

    private DeviceRecognizer() {}

    /** From now on the device has one. */
    public static void install(Application application) {
        final ShadowPackageManager packages = shadowOf(application.getPackageManager());
        final ComponentName service = new ComponentName(PACKAGE, PACKAGE + ".Service");
        packages.addServiceIfNotPresent(service);
        try {
            packages.addIntentFilterForService(
                    service, new IntentFilter(RecognitionService.SERVICE_INTERFACE));
        } catch (Exception unknownPackage) {
            throw new AssertionError(unknownPackage);
        }
    }

    private static ShadowSpeechRecognizer latest() {
        KitTest.drainMain();
        final SpeechRecognizer recognizer = ShadowSpeechRecognizer.getLatestSpeechRecognizer();
        assertNotNull("the device recognizer was not used", recognizer);
        return Shadow.extract(recognizer);
    }

    /** Whether it has been asked to listen. */
    public static boolean isUsed() {
        KitTest.drainMain();
        return ShadowSpeechRecognizer.getLatestSpeechRecognizer() != null;
    }

    public static Intent getIntent() {
        return latest().getLastRecognizerIntent();
    }

    public static boolean isDestroyed() {
        return latest().isDestroyed();
    }

    /** A callback of the recognizer. */
    public interface Callback {
        void call(RecognitionListener listener);
    }

    /** Calls back on the main looper, as the device does. */
    public static void callBack(Callback callback) {
        final RecognitionListener listener = getListener();
        KitTest.onMain(() -> callback.call(listener));
    }

    /** The framework hands the listener over after some turns of the main looper. */
    public static RecognitionListener getListener() {
        final Object state = ReflectionHelpers.callInstanceMethod(latest(), "getState");
        RecognitionListener listener = null;
        for (int turn = 0; listener == null && turn < 10; turn++) {
            KitTest.drainMain();
            listener = ReflectionHelpers.getField(state, "recognitionListener");
        }
        assertNotNull("the device recognizer has no listener", listener);
        return listener;
    }

    /**
     * @param confidences null for none
     */
    public static Bundle results(float[] confidences, String... texts) {
        final Bundle results = new Bundle();
        results.putStringArrayList(
                SpeechRecognizer.RESULTS_RECOGNITION, new ArrayList<>(Arrays.asList(texts)));
        if (confidences != null) {
            results.putFloatArray(SpeechRecognizer.CONFIDENCE_SCORES, confidences);
        }
        return results;
    }
}
