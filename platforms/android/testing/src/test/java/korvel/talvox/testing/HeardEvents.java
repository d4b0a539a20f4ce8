package korvel.talvox.testing;

import java.util.ArrayList;
import java.util.List;
import korvel.talvox.ErrorDetail;
import korvel.talvox.Recognition;
import korvel.talvox.RecognitionListener;
import korvel.talvox.SpeechError;

/** Keeps the events of a session in words. */
class HeardEvents implements RecognitionListener {
    final List<String> all = new ArrayList<>();

    /** Called in each event, after it has been kept. */
    void meanwhile(String event) {}

    private void add(String event) {
        all.add(event);
        meanwhile(event);
    }

    @Override
    public void onRecordingBegin() {
        add("recordingBegin");
    }

    @Override
    public void onSpeakingBegin() {
        add("speakingBegin");
    }

    @Override
    public void onRecordingDone() {
        add("recordingDone");
    }

    @Override
    public void onBufferReceived(byte[] pcm) {
        add("buffer " + pcm.length);
    }

    @Override
    public void onPowerChanged(float level) {
        add("level " + level);
    }

    @Override
    public void onResults(Recognition recognition) {
        add("results " + recognition.getHypotheses());
    }

    @Override
    public void onError(SpeechError error, ErrorDetail detail) {
        add("error " + error + ": " + detail);
    }
}
