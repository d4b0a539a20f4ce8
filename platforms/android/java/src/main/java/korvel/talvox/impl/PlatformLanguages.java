package korvel.talvox.impl;

import android.app.Activity;
import android.content.BroadcastReceiver;
import android.content.Context;
import android.content.Intent;
import android.os.Bundle;
import android.os.Handler;
import android.os.Looper;
import android.speech.RecognizerIntent;
import android.util.Log;
import java.util.ArrayList;
import java.util.Collections;
import org.jspecify.annotations.Nullable;

/**
 * The languages of the device recognizer: asked for by an ordered broadcast, kept from then on.
 * All methods may be called from any thread and return at once.
 */
final class PlatformLanguages {
    private static final String TAG = "Talvox";

    private final ArrayList<String> languages = new ArrayList<>();
    private String preference = "";

    /** Who has asked and has not been answered with nothing. */
    private @Nullable Context asker;

    /** Asks, unless that has been done; after an empty answer it is done again. */
    void query(Context context) {
        synchronized (this) {
            if (asker == context) {
                return;
            }
            asker = context;
        }
        final Intent details = RecognizerIntent.getVoiceDetailsIntent(context);
        final Intent question =
                details != null ? details : new Intent(RecognizerIntent.ACTION_GET_LANGUAGE_DETAILS);
        try {
            context.sendOrderedBroadcast(
                    question,
                    null,
                    new BroadcastReceiver() {
                        @Override
                        public void onReceive(Context ignored, Intent alsoIgnored) {
                            keep(getResultExtras(true));
                        }
                    },
                    new Handler(Looper.getMainLooper()),
                    Activity.RESULT_OK,
                    null,
                    null);
        } catch (RuntimeException failure) {
            Log.w(TAG, "asking for the languages of the device recognizer failed", failure);
            keep(Bundle.EMPTY);
        }
    }

    private synchronized void keep(Bundle answer) {
        final ReceivedBundle received = new ReceivedBundle(answer);
        final ReceivedBundle.Texts supported =
                received.getTexts(RecognizerIntent.EXTRA_SUPPORTED_LANGUAGES);
        supported.logOmitted();
        languages.clear();
        Collections.addAll(languages, supported.toArray());
        preference = received.getText(RecognizerIntent.EXTRA_LANGUAGE_PREFERENCE);
        if (languages.isEmpty()) {
            asker = null;
        }
    }

    /** A copy of what is known; empty until the device has answered. */
    synchronized ArrayList<String> get() {
        return new ArrayList<>(languages);
    }

    /** The language that the user chose for recognition on the device, empty if not known. */
    synchronized String getPreference() {
        return preference;
    }
}
