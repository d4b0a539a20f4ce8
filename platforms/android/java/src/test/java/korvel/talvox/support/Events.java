package korvel.talvox.support;

import static org.junit.Assert.assertNotNull;

import java.io.ByteArrayOutputStream;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.LinkedBlockingQueue;
import java.util.concurrent.BlockingQueue;
import java.util.concurrent.TimeUnit;
import korvel.talvox.Recognition;
import korvel.talvox.RecognitionListener;
import korvel.talvox.SpeechError;

/** Keeps what a listener hears. */
public class Events implements RecognitionListener {
    private final BlockingQueue<String> milestones = new LinkedBlockingQueue<>();
    private final List<String> all = new ArrayList<>();
    private final ByteArrayOutputStream sound = new ByteArrayOutputStream();
    private int levels;
    private Recognition recognition;
    private SpeechError error;
    private Thread thread;

    private synchronized void add(String event) {
        thread = Thread.currentThread();
        all.add(event);
        milestones.add(event);
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
    public synchronized void onBufferReceived(byte[] pcm) {
        sound.write(pcm, 0, pcm.length);
    }

    @Override
    public synchronized void onPowerChanged(float level) {
        levels++;
    }

    @Override
    public void onResults(Recognition results) {
        synchronized (this) {
            recognition = results;
        }
        add("results");
    }

    @Override
    public void onError(SpeechError why) {
        synchronized (this) {
            error = why;
        }
        add("error " + why);
    }

    /** Waits for the next event that is neither sound nor level. */
    public String next() throws InterruptedException {
        final String event = milestones.poll(KitTest.PATIENCE_S, TimeUnit.SECONDS);
        assertNotNull("no event came after " + getAll(), event);
        return event;
    }

    /** Waits for results or an error and returns it. */
    public String end() throws InterruptedException {
        while (true) {
            final String event = next();
            if (event.equals("results") || event.startsWith("error")) {
                return event;
            }
        }
    }

    /** Events so far, without sound and levels. */
    public synchronized List<String> getAll() {
        return new ArrayList<>(all);
    }

    public synchronized byte[] getSound() {
        return sound.toByteArray();
    }

    public synchronized int getLevels() {
        return levels;
    }

    public synchronized Recognition getRecognition() {
        return recognition;
    }

    public synchronized SpeechError getError() {
        return error;
    }

    /** The thread of the last event. */
    public synchronized Thread getThread() {
        return thread;
    }
}
