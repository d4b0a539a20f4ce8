package org.example.dictation;

import android.Manifest;
import android.app.Activity;
import android.content.pm.PackageManager;
import android.os.Bundle;
import android.util.Log;
import android.widget.TextView;

import java.util.List;

import korvel.talvox.AsrPolicy;
import korvel.talvox.ErrorDetail;
import korvel.talvox.Hypothesis;
import korvel.talvox.Outcome;
import korvel.talvox.Recognition;
import korvel.talvox.RecognitionListener;
import korvel.talvox.SoundFormat;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;

/** Touch the text and speak: it becomes what was recognised. */
public class DictationActivity extends Activity implements RecognitionListener {
    private static final int ASK_FOR_MICROPHONE = 1;

    private TalvoxEngine engine;
    private TalvoxRecognizer recognizer;
    private TextView text;

    @Override
    protected void onCreate(Bundle state) {
        super.onCreate(state);
        text = new TextView(this);
        text.setOnClickListener(view -> listen());
        text.setText("Touch and speak");
        setContentView(text);

        engine = TalvoxEngine.getInstance(this);
        engine.updateSettings(TalvoxSettings.builder()
                .set(TalvoxSettings.URL, "https://asr.example.org")
                .set(TalvoxSettings.UUID, "0123456789abcdef0123456789abcdef") // of the installation
                .set(TalvoxSettings.LANGUAGE, "en-US")
                .set(TalvoxSettings.STREAMING, true)
                .set(TalvoxSettings.SOUND_FORMAT, SoundFormat.SPEEX)
                .build());
    }

    private void listen() {
        if (checkSelfPermission(Manifest.permission.RECORD_AUDIO)
                != PackageManager.PERMISSION_GRANTED) {
            requestPermissions(
                    new String[] {Manifest.permission.RECORD_AUDIO}, ASK_FOR_MICROPHONE);
            return;
        }
        stopListening();
        // The device recognizer if there is one, else the gateway.
        recognizer = engine.createRecognizer(
                TalvoxSettings.forRecognition()
                        .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_FIRST)
                        .build(),
                this);
        recognizer.start();
    }

    private void stopListening() {
        if (recognizer != null) {
            recognizer.close();
            recognizer = null;
        }
    }

    @Override
    public void onRecordingBegin() {
        text.setText("Speak now");
    }

    @Override
    public void onRecordingDone() {
        text.setText("...");
    }

    @Override
    public void onResults(Recognition recognition) {
        List<Hypothesis> heard = recognition.getHypotheses();
        // The device recognizer may give no confidences: two hypotheses or more, however good,
        // count as rejected then.
        boolean isRejected = recognition.getOutcome() == Outcome.REJECTED
                && heard.get(0).hasConfidence();
        text.setText(heard.isEmpty() || isRejected ? "Please say it again" : heard.toString());
    }

    @Override
    public void onError(SpeechError error, ErrorDetail detail) {
        Log.e("Dictation", error.getText() + ": " + detail);
        text.setText("That did not work");
    }

    @Override
    protected void onStop() {
        stopListening();
        super.onStop();
    }
}
