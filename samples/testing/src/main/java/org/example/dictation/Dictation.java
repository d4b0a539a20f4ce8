package org.example.dictation;

import java.util.List;
import korvel.talvox.ErrorDetail;
import korvel.talvox.Hypothesis;
import korvel.talvox.Outcome;
import korvel.talvox.Recognition;
import korvel.talvox.RecognitionListener;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;

/** What a screen for dictation shows: the part of an application that is worth testing. */
public final class Dictation implements RecognitionListener {
    private final TalvoxEngine engine;
    private TalvoxRecognizer recognizer;
    private String text = "Touch and speak";
    private float loudest;
    private boolean mayRetry;

    public Dictation(TalvoxEngine engine) {
        this.engine = engine;
    }

    /** Begins to listen; what was going on before is given up. */
    public void listen() {
        close();
        loudest = 0;
        mayRetry = false;
        recognizer = engine.createRecognizer(
                TalvoxSettings.forRecognition().set(TalvoxSettings.LANGUAGE, "en-US").build(),
                this);
        recognizer.start();
    }

    /** The user has said all. */
    public void send() {
        recognizer.stop();
    }

    /** The user has changed his mind. */
    public void giveUp() {
        recognizer.cancel();
    }

    /** The screen goes. */
    public void close() {
        if (recognizer != null) {
            recognizer.close();
            recognizer = null;
        }
    }

    public String getText() {
        return text;
    }

    public boolean mayRetry() {
        return mayRetry;
    }

    public float getLoudest() {
        return loudest;
    }

    @Override
    public void onRecordingBegin() {
        text = "Speak now";
    }

    @Override
    public void onPowerChanged(float level) {
        loudest = Math.max(loudest, level);
    }

    @Override
    public void onRecordingDone() {
        text = "...";
    }

    @Override
    public void onResults(Recognition recognition) {
        List<Hypothesis> heard = recognition.getHypotheses();
        boolean isRejected = recognition.getOutcome() == Outcome.REJECTED
                && heard.get(0).hasConfidence();
        if (heard.isEmpty() || isRejected) {
            text = "Please say it again";
        } else if (recognition.getOutcome() == Outcome.ACCEPTED) {
            text = heard.get(0).getText();
        } else {
            text = "Did you say \"" + heard.get(0).getText() + "\"?";
        }
    }

    @Override
    public void onError(SpeechError error, ErrorDetail detail) {
        switch (error) {
            case CANCELED:
                text = "Touch and speak";
                break;
            case NO_VOICE:
                text = "I heard nothing";
                break;
            case NETWORK:
                Integer status = detail.getHttpStatus();
                mayRetry = status == null || status >= 500;
                text = mayRetry ? "No connection" : "The service refuses";
                break;
            case BUSY:
                text = "Busy";
                break;
            default:
                text = "That did not work";
        }
    }
}
