package korvel.talvox;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertTrue;
import static org.robolectric.Shadows.shadowOf;

import android.Manifest;
import android.app.Activity;
import android.content.BroadcastReceiver;
import android.content.ComponentName;
import android.content.ContentResolver;
import android.content.Context;
import android.content.ContextWrapper;
import android.content.Intent;
import android.content.IntentFilter;
import android.os.Bundle;
import android.os.Parcel;
import android.speech.RecognizerIntent;
import android.speech.SpeechRecognizer;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Collections;
import java.util.List;
import korvel.talvox.support.DeviceRecognizer;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;
import org.robolectric.shadows.ShadowLog;

/** Recognitions by the device recognizer. */
public class PlatformRecognizerTest extends EngineTestCase {
    private static final TalvoxSettings ON_DEVICE =
            TalvoxSettings.builder()
                    .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_ONLY)
                    .set(TalvoxSettings.LANGUAGE, "en-GB")
                    .build();

    private final Events events = new Events();
    private TalvoxRecognizer recognizer;

    @Before
    public void installRecognizer() {
        DeviceRecognizer.install(application);
    }

    @After
    public void close() {
        if (recognizer != null) {
            recognizer.close();
        }
    }

    private void start(TalvoxSettings settings) {
        recognizer = engine.createRecognizer(settings, events);
        recognizer.start();
        drainMain();
    }

    private void start() {
        start(ON_DEVICE);
    }

    private List<String> heard() {
        drainMain();
        return events.getAll();
    }

    @Test
    public void asksTheDeviceForTheLanguage() {
        start();
        final Intent intent = DeviceRecognizer.getIntent();
        assertEquals(RecognizerIntent.ACTION_RECOGNIZE_SPEECH, intent.getAction());
        assertEquals("en-GB", intent.getStringExtra(RecognizerIntent.EXTRA_LANGUAGE));
        assertEquals(
                RecognizerIntent.LANGUAGE_MODEL_FREE_FORM,
                intent.getStringExtra(RecognizerIntent.EXTRA_LANGUAGE_MODEL));
        assertTrue(intent.getBooleanExtra(RecognizerIntent.EXTRA_PARTIAL_RESULTS, false));
    }

    @Test
    public void asksForAModelOfSearchesWhereTheModelIsNotGeneral() {
        start(
                ON_DEVICE
                        .toBuilder()
                        .set(TalvoxSettings.MODEL, RecognitionModel.MAPS)
                        .build());
        assertEquals(
                RecognizerIntent.LANGUAGE_MODEL_WEB_SEARCH,
                DeviceRecognizer.getIntent()
                        .getStringExtra(RecognizerIntent.EXTRA_LANGUAGE_MODEL));
    }

    @Test
    public void everyCallbackBecomesItsEvent() {
        start();
        DeviceRecognizer.callBack(device -> device.onReadyForSpeech(new Bundle()));
        DeviceRecognizer.callBack(device -> device.onBeginningOfSpeech());
        DeviceRecognizer.callBack(device -> device.onRmsChanged(4.5f));
        DeviceRecognizer.callBack(device -> device.onRmsChanged(-2f));
        DeviceRecognizer.callBack(device -> device.onBufferReceived(new byte[320]));
        DeviceRecognizer.callBack(device -> device.onBufferReceived(null));
        DeviceRecognizer.callBack(device -> device.onEvent(3, new Bundle()));
        DeviceRecognizer.callBack(
                device -> device.onPartialResults(DeviceRecognizer.results(null, "go")));
        DeviceRecognizer.callBack(device -> device.onPartialResults(new Bundle()));
        DeviceRecognizer.callBack(device -> device.onEndOfSpeech());
        DeviceRecognizer.callBack(
                device ->
                        device.onResults(
                                DeviceRecognizer.results(
                                        new float[] {0.95f, 0.5f}, "go forward", "ноу\uD83D\uDE00")));
        assertEquals(
                Arrays.asList("recordingBegin", "speakingBegin", "recordingDone", "results"),
                heard());
        assertEquals(2, events.getLevels());
        assertArrayEquals(new byte[0], events.getSound());
        assertEquals(
                Recognition.fromNative(
                        1,
                        new String[] {"go forward", "ноу\uD83D\uDE00"},
                        new float[] {0.95f, 0.5f},
                        ""),
                events.getRecognition());
        assertTrue(DeviceRecognizer.isDestroyed());
    }

    @Test
    public void withoutConfidencesEveryHypothesisHasNone() {
        start();
        DeviceRecognizer.callBack(
                device -> device.onResults(DeviceRecognizer.results(null, "one", "two")));
        assertEquals(Collections.singletonList("results"), heard());
        assertEquals(Outcome.REJECTED, events.getRecognition().getOutcome());
        for (Hypothesis hypothesis : events.getRecognition().getHypotheses()) {
            assertFalse(hypothesis.hasConfidence());
            assertEquals(-1.0f, hypothesis.getConfidence(), 0);
        }
    }

    @Test
    public void confidencesThatDoNotFitAreNotUsed() {
        start();
        DeviceRecognizer.callBack(
                device ->
                        device.onResults(DeviceRecognizer.results(new float[] {0.9f}, "a", "b")));
        heard();
        assertEquals(
                Arrays.asList("a", "b"),
                Arrays.asList(
                        events.getRecognition().getHypotheses().get(0).getText(),
                        events.getRecognition().getHypotheses().get(1).getText()));
        assertFalse(events.getRecognition().getHypotheses().get(0).hasConfidence());
    }

    @SuppressWarnings("unchecked")
    private static <T> ArrayList<T> mixed(Object... entries) {
        return (ArrayList<T>) new ArrayList<>(Arrays.asList(entries));
    }

    /** What arrives in this process when another one sends the bundle. */
    private static Bundle sent(Bundle bundle) {
        final Parcel parcel = Parcel.obtain();
        try {
            parcel.writeBundle(bundle);
            parcel.setDataPosition(0);
            return parcel.readBundle(PlatformRecognizerTest.class.getClassLoader());
        } finally {
            parcel.recycle();
        }
    }

    private static Bundle mixedResults() {
        final Bundle results = new Bundle();
        results.putStringArrayList(
                SpeechRecognizer.RESULTS_RECOGNITION, mixed(null, "one", 2, new Bundle(), "three"));
        results.putFloatArray(
                SpeechRecognizer.CONFIDENCE_SCORES, new float[] {0.1f, 0.95f, 0.2f, 0.3f, 0.5f});
        return results;
    }

    @Test
    public void hypothesesThatAreNotTextsAreLeftOutWithTheirScores() throws Exception {
        for (Bundle results : new Bundle[] {mixedResults(), sent(mixedResults())}) {
            ShadowLog.reset();
            final Events heard = new Events();
            try (TalvoxRecognizer one = engine.createRecognizer(ON_DEVICE, heard)) {
                one.start();
                DeviceRecognizer.callBack(device -> device.onPartialResults(results));
                DeviceRecognizer.callBack(device -> device.onResults(results));
                assertEquals("results", heard.end());
                assertEquals(
                        Recognition.fromNative(
                                1,
                                new String[] {"one", "three"},
                                new float[] {0.95f, 0.5f},
                                ""),
                        heard.getRecognition());
            }
            final String line = "3 of 5 entries of results_recognition are not texts, ignored";
            assertLogged(line);
            assertEquals("logged once", log().indexOf(line), log().lastIndexOf(line));
        }
    }

    @Test
    public void resultsWithoutAnyTextAreEmptyResults() throws Exception {
        final Bundle numbers = new Bundle();
        numbers.putIntegerArrayList(
                SpeechRecognizer.RESULTS_RECOGNITION, new ArrayList<>(Arrays.asList(1, 2)));
        final Bundle noList = new Bundle();
        noList.putString(SpeechRecognizer.RESULTS_RECOGNITION, "words");
        noList.putString(SpeechRecognizer.CONFIDENCE_SCORES, "0.5");
        for (Bundle results : new Bundle[] {numbers, sent(numbers), noList}) {
            final Events heard = new Events();
            try (TalvoxRecognizer one = engine.createRecognizer(ON_DEVICE, heard)) {
                one.start();
                DeviceRecognizer.callBack(device -> device.onResults(results));
                assertEquals("results", heard.end());
                assertTrue(heard.getRecognition().getHypotheses().isEmpty());
            }
        }
    }

    @Test
    public void partialResultsNeverReachTheListener() {
        start();
        DeviceRecognizer.callBack(
                device ->
                        device.onPartialResults(
                                DeviceRecognizer.results(new float[] {0.9f}, "go")));
        assertTrue(heard().isEmpty());
        recognizer.cancel();
        assertEquals(Collections.singletonList("error CANCELED"), heard());
    }

    @Test
    public void everyErrorNumberBecomesItsError() throws Exception {
        final SpeechError[] expected = {
            SpeechError.UNKNOWN,
            SpeechError.NETWORK,
            SpeechError.NETWORK,
            SpeechError.AUDIO,
            SpeechError.SERVER,
            SpeechError.UNKNOWN,
            SpeechError.NO_VOICE,
            null,
            SpeechError.BUSY,
            SpeechError.AUDIO,
            SpeechError.BUSY,
            SpeechError.SERVER,
            SpeechError.NOT_AVAILABLE,
            SpeechError.NOT_AVAILABLE,
            SpeechError.UNKNOWN
        };
        engine.updateSettings(TalvoxSettings.builder().set(TalvoxSettings.VERBOSITY, 2).build());
        for (int number = 0; number < expected.length; number++) {
            final int error = number;
            final Events heard = new Events();
            try (TalvoxRecognizer one = engine.createRecognizer(ON_DEVICE, heard)) {
                one.start();
                DeviceRecognizer.callBack(device -> device.onError(error));
                if (expected[number] == null) {
                    assertEquals("results", heard.end());
                    assertTrue(heard.getRecognition().getHypotheses().isEmpty());
                    assertEquals(Outcome.UNCERTAIN, heard.getRecognition().getOutcome());
                } else {
                    assertEquals("error " + expected[number], heard.end());
                }
            }
        }
        assertLogged("Request finished with empty results in ");
        assertLogged("RECORD_AUDIO");
    }

    @Test
    public void resultsWithoutATextAreEmptyResults() throws Exception {
        for (Bundle nothing : new Bundle[] {null, new Bundle(), DeviceRecognizer.results(null)}) {
            final Events heard = new Events();
            try (TalvoxRecognizer one = engine.createRecognizer(ON_DEVICE, heard)) {
                one.start();
                DeviceRecognizer.callBack(device -> device.onResults(nothing));
                assertEquals("results", heard.end());
                assertTrue(heard.getRecognition().getHypotheses().isEmpty());
            }
        }
    }

    @Test
    public void stopIsPassedOnAndResultsFollow() {
        start();
        recognizer.stop();
        drainMain();
        DeviceRecognizer.callBack(
                device -> device.onResults(DeviceRecognizer.results(null, "done")));
        assertEquals(Collections.singletonList("results"), heard());
    }

    @Test
    public void cancelEndsTheDevicesSessionAndLateCallbacksAreIgnored() {
        start();
        DeviceRecognizer.callBack(device -> device.onReadyForSpeech(null));
        recognizer.cancel();
        assertTrue(DeviceRecognizer.isDestroyed());
        DeviceRecognizer.callBack(device -> device.onRmsChanged(1f));
        DeviceRecognizer.callBack(
                device -> device.onResults(DeviceRecognizer.results(null, "late")));
        assertEquals(Arrays.asList("recordingBegin", "error CANCELED"), heard());
        assertEquals(0, events.getLevels());
        recognizer.close();
        DeviceRecognizer.callBack(device -> device.onError(5));
        assertEquals(2, heard().size());
    }

    @Test
    public void aSecondTerminalCallbackIsIgnored() {
        start();
        DeviceRecognizer.callBack(device -> device.onError(7));
        DeviceRecognizer.callBack(device -> device.onError(5));
        assertEquals(Collections.singletonList("results"), heard());
    }

    /** An application whose context fails when the device recognizer is started. */
    private void startIn(Context context) throws Exception {
        TalvoxEngine.getInstance(context);
        start();
        assertEquals("error NOT_AVAILABLE", events.end());
        TalvoxEngine.getInstance(application);
        final Events next = new Events();
        try (TalvoxRecognizer one = engine.createRecognizer(ON_DEVICE, next)) {
            one.start(); // the failed one does not stand in its way
            DeviceRecognizer.callBack(
                    device -> device.onResults(DeviceRecognizer.results(null, "next")));
            assertEquals("results", next.end());
        }
        assertEquals(1, heard().size());
    }

    @Test
    public void anExceptionFromStartIsNotAvailable() throws Exception {
        startIn(
                new ContextWrapper(application) {
                    @Override
                    public Context getApplicationContext() {
                        return this;
                    }

                    @Override
                    public ContentResolver getContentResolver() {
                        throw new SecurityException("refused for the test");
                    }
                });
    }

    @Test
    public void anExceptionOnTheMainLooperIsNotAvailable() throws Exception {
        startIn(
                new ContextWrapper(application) {
                    @Override
                    public Context getApplicationContext() {
                        return this;
                    }

                    @Override
                    public String getPackageName() {
                        throw new SecurityException("refused for the test");
                    }
                });
        assertLogged("the device recognizer does not start");
    }

    @Test
    public void withoutADevicesRecogniserItIsNotAvailable() throws Exception {
        final ComponentName service =
                new ComponentName(DeviceRecognizer.PACKAGE, DeviceRecognizer.PACKAGE + ".Service");
        assertTrue(engine.isRecognitionAvailable(ON_DEVICE));
        onMain(() -> shadowOf(application.getPackageManager()).removeService(service));
        assertFalse(engine.isRecognitionAvailable(ON_DEVICE));
        start();
        assertEquals("error NOT_AVAILABLE", events.end());
    }

    @Test
    public void withoutThePermissionItIsAnErrorOfTheSoundAndTheLogSaysWhy() throws Exception {
        shadowOf(application).denyPermissions(Manifest.permission.RECORD_AUDIO);
        start();
        assertEquals("error AUDIO", events.end());
        assertLogged("RECORD_AUDIO");
        assertFalse(DeviceRecognizer.isUsed());
    }

    @Test
    public void aSecondRecognitionIsBusyAndTouchesNoDevice() throws Exception {
        start();
        final Events second = new Events();
        try (TalvoxRecognizer refused = engine.createRecognizer(ON_DEVICE, second)) {
            refused.start();
            assertEquals("error BUSY", second.end());
        }
        DeviceRecognizer.callBack(
                device -> device.onResults(DeviceRecognizer.results(null, "first")));
        assertEquals(Collections.singletonList("results"), heard());
    }

    @Test
    public void theNextOneMayStartFromInsideOnResults() throws Exception {
        final Events second = new Events();
        final Events first =
                new Events() {
                    @Override
                    public void onResults(Recognition recognition) {
                        recognizer = engine.createRecognizer(ON_DEVICE, second);
                        recognizer.start();
                        super.onResults(recognition);
                    }
                };
        try (TalvoxRecognizer one = engine.createRecognizer(ON_DEVICE, first)) {
            one.start();
            DeviceRecognizer.callBack(
                    device -> device.onResults(DeviceRecognizer.results(null, "one")));
            assertEquals("results", first.end());
        }
        DeviceRecognizer.callBack(
                device -> device.onResults(DeviceRecognizer.results(null, "two")));
        assertEquals("results", second.end());
        assertEquals("two", second.getRecognition().getHypotheses().get(0).getText());
    }

    @Test
    public void otherLanguagesOfTheDeviceJoinTheLanguages() {
        application.registerReceiver(
                new BroadcastReceiver() {
                    @Override
                    public void onReceive(Context context, Intent intent) {
                        final Bundle answer = new Bundle();
                        answer.putStringArrayList(
                                RecognizerIntent.EXTRA_SUPPORTED_LANGUAGES,
                                mixed(7, "uk-UA", null, new Bundle(), "de-DE"));
                        answer.putString(RecognizerIntent.EXTRA_LANGUAGE_PREFERENCE, "de-DE");
                        setResult(Activity.RESULT_OK, null, answer);
                    }
                },
                new IntentFilter(RecognizerIntent.ACTION_GET_LANGUAGE_DETAILS),
                Context.RECEIVER_EXPORTED);
        for (int turn = 0; turn < 10; turn++) {
            drainMain();
            engine.getAvailableLanguages(); // asks, if it has not been answered
        }
        assertEquals(
                Arrays.asList("de-DE", "ru-RU", "tr-TR", "uk-UA"), engine.getAvailableLanguages());
        assertLogged("3 of 5 entries of android.speech.extra.SUPPORTED_LANGUAGES are not texts");
        final Bundle settings =
                TalvoxSettings.forRecognition()
                        .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_ONLY)
                        .build()
                        .toBundle();
        settings.putString(TalvoxSettings.LANGUAGE.getName(), ""); // a builder refuses it
        start(TalvoxSettings.fromBundle(settings));
        assertEquals(
                "de-DE",
                DeviceRecognizer.getIntent().getStringExtra(RecognizerIntent.EXTRA_LANGUAGE));
        assertNull(events.getError());
    }
}
