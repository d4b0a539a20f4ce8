package org.example.dictation;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import korvel.talvox.Outcome;
import korvel.talvox.Recognition;
import korvel.talvox.RecorderState;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.testing.ErrorDetailBuilder;
import korvel.talvox.testing.FakeEngine;
import korvel.talvox.testing.RecognitionBuilder;
import korvel.talvox.testing.Script;
import org.junit.After;
import org.junit.Test;

/** The outcomes of a dictation, on a JVM, without a device and without waiting. */
public class DictationTest {
    private final FakeEngine fake = new FakeEngine();
    private final Dictation dictation = new Dictation(fake.getEngine());

    @After
    public void close() {
        dictation.close();
        fake.close();
    }

    /** Somebody speaks from 500 ms on, for two seconds. */
    private static Script.Builder spoken() {
        return Script.cloud()
                .after(300).recordingBegin()
                .after(200).speakingBegin()
                .after(100).level(52)
                .after(1900).recordingDone()
                .after(400);
    }

    private void listen(Script script) {
        fake.play(script);
        dictation.listen();
    }

    private String dictate(Script script) {
        listen(script);
        fake.finish();
        return dictation.getText();
    }

    @Test
    public void showsWhatWasSaid() {
        listen(spoken().results(RecognitionBuilder.accepted("go forward")).build());
        assertEquals("Touch and speak", dictation.getText());
        fake.advanceBy(300);
        assertEquals("Speak now", dictation.getText());
        fake.advanceBy(2200);
        assertEquals("...", dictation.getText());
        fake.advanceBy(400);
        assertEquals("go forward", dictation.getText());
        assertEquals(52, dictation.getLoudest(), 0);
        assertEquals("en-US", fake.getSessionSettings().get(TalvoxSettings.LANGUAGE));
    }

    @Test
    public void asksWhereTheEngineIsUncertain() {
        Recognition recognition = new RecognitionBuilder(Outcome.UNCERTAIN)
                .hypothesis("four", 0.5f)
                .hypothesis("for", 0.45f)
                .build();
        assertEquals("Did you say \"four\"?", dictate(spoken().results(recognition).build()));
    }

    @Test
    public void asksAgainForWhatIsRejected() {
        Recognition recognition =
                new RecognitionBuilder(Outcome.REJECTED).hypothesis("hm", 0.1f).build();
        assertEquals("Please say it again", dictate(spoken().results(recognition).build()));
    }

    @Test
    public void asksAgainWhereNothingWasRecognised() {
        assertEquals(
                "Please say it again",
                dictate(spoken().results(RecognitionBuilder.empty()).build()));
    }

    @Test
    public void saysSoWhenNobodySpeaks() {
        assertEquals("I heard nothing", dictate(Script.cloud().after(300).recordingBegin().build()));
        assertEquals(5000, fake.getTimeMs());
    }

    @Test
    public void offersToTryAgainWithoutAConnection() {
        assertEquals("No connection", dictate(spoken().error(SpeechError.NETWORK).build()));
        assertTrue(dictation.mayRetry());
    }

    @Test
    public void offersNothingWhereTheServiceRefuses() {
        Script refused = spoken()
                .error(
                        SpeechError.NETWORK,
                        new ErrorDetailBuilder().reason("HTTP status 403").httpStatus(403).build())
                .build();
        assertEquals("The service refuses", dictate(refused));
        assertFalse(dictation.mayRetry());
    }

    @Test
    public void waitsTwentySecondsForTheGateway() {
        listen(spoken().build());
        fake.advanceBy(2500 + 19_999);
        assertEquals("...", dictation.getText());
        fake.advanceBy(1);
        assertEquals("No connection", dictation.getText());
    }

    @Test
    public void reportsAMicrophoneThatFails() {
        Script noPermission = Script.cloud()
                .error(
                        SpeechError.AUDIO,
                        new ErrorDetailBuilder().recorderState(RecorderState.NO_PERMISSION).build())
                .build();
        assertEquals("That did not work", dictate(noPermission));
    }

    @Test
    public void sendsAtOnceWhatWasSaidSoFar() {
        listen(spoken().results(RecognitionBuilder.accepted("go")).build());
        fake.advanceBy(900);
        dictation.send();
        fake.advanceBy(0);
        assertEquals("...", dictation.getText());
        fake.advanceBy(400);
        assertEquals("go", dictation.getText());
    }

    @Test
    public void startsAgainAfterTheUserGaveUp() {
        listen(spoken().build());
        fake.advanceBy(600);
        dictation.giveUp();
        fake.advanceBy(0);
        assertEquals("Touch and speak", dictation.getText());
        assertEquals(
                "go", dictate(spoken().results(RecognitionBuilder.accepted("go")).build()));
    }

    @Test
    public void hearsNothingMoreOfWhatItReplaced() {
        listen(spoken().results(RecognitionBuilder.accepted("old")).build());
        fake.advanceBy(1000);
        assertEquals(
                "new", dictate(spoken().results(RecognitionBuilder.accepted("new")).build()));
        assertEquals(2, fake.getStartCount());
    }
}
