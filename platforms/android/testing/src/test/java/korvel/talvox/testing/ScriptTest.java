package korvel.talvox.testing;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertThrows;

import java.util.List;
import java.util.stream.Collectors;
import korvel.talvox.ErrorDetail;
import korvel.talvox.Outcome;
import korvel.talvox.Recognition;
import korvel.talvox.RecorderState;
import korvel.talvox.SpeechError;
import org.junit.Test;
import org.junit.function.ThrowingRunnable;

/** Scripts that keep the engine's contract, and those that are refused because they do not. */
public class ScriptTest {
    private static final Recognition GO = RecognitionBuilder.accepted("go");

    private static Script.Builder ready() {
        return Script.cloud().after(300).recordingBegin();
    }

    private static Script.Builder speaking() {
        return ready().after(200).speakingBegin();
    }

    private static Script.Builder sending() {
        return speaking().after(500).recordingDone();
    }

    private static void assertRefused(String why, ThrowingRunnable call) {
        assertEquals(why, assertThrows(IllegalStateException.class, call).getMessage());
    }

    private static List<String> describe(Script script) {
        return script.getEvents().stream().map(String::valueOf).collect(Collectors.toList());
    }

    @Test
    public void nothingComesAfterTheEnd() {
        final String end = ": the session has ended, onResults at 1000 ms";
        assertRefused("onResults" + end, () -> sending().results(GO).results(GO));
        assertRefused(
                "onError NETWORK" + end,
                () -> sending().results(GO).after(5).error(SpeechError.NETWORK));
        assertRefused("onPowerChanged" + end, () -> sending().results(GO).level(1));
        assertRefused("onBufferReceived" + end, () -> sending().results(GO).buffer(new byte[2]));
        assertRefused(
                "onSpeakingBegin: the session has ended, onError AUDIO at 300 ms",
                () -> ready().error(SpeechError.AUDIO).speakingBegin());
        assertRefused(
                "onRecordingBegin: the session has ended, onError AUDIO at 0 ms",
                () -> Script.cloud().error(SpeechError.AUDIO).recordingBegin());
        assertRefused(
                "onRecordingDone: the session has ended, onResults at 500 ms",
                () -> speaking().results(GO).recordingDone());
    }

    @Test
    public void noEventComesTwice() {
        assertRefused("onRecordingBegin: a second time", () -> ready().recordingBegin());
        assertRefused("onSpeakingBegin: a second time", () -> speaking().speakingBegin());
        assertRefused("onRecordingDone: a second time", () -> sending().recordingDone());
        assertRefused(
                "onRecordingBegin: a second time",
                () -> Script.device().recordingBegin().recordingBegin());
    }

    @Test
    public void theCloudRecognizerKeepsItsOrder() {
        assertRefused(
                "onSpeakingBegin: before onRecordingBegin", () -> Script.cloud().speakingBegin());
        assertRefused(
                "onRecordingDone: before onSpeakingBegin", () -> ready().recordingDone());
        assertRefused(
                "onPowerChanged: before onRecordingBegin", () -> Script.cloud().level(1));
        assertRefused(
                "onBufferReceived: before onRecordingBegin",
                () -> Script.cloud().buffer(new byte[2]));
        assertRefused("onPowerChanged: after onRecordingDone", () -> sending().level(1));
        assertRefused(
                "onBufferReceived: after onRecordingDone", () -> sending().buffer(new byte[2]));
    }

    @Test
    public void theDeviceRecognizerHasAnOrderOfItsOwn() {
        assertEquals(
                List.of(
                        "onPowerChanged at 0 ms",
                        "onRecordingDone at 0 ms",
                        "onSpeakingBegin at 10 ms",
                        "onResults at 10 ms"),
                describe(
                        Script.device()
                                .level(1)
                                .recordingDone()
                                .after(10)
                                .speakingBegin()
                                .results(GO)
                                .build()));
        assertRefused(
                "onBufferReceived: the device recognizer does not deliver sound",
                () -> Script.device().buffer(new byte[2]));
    }

    @Test
    public void eachRecognizerHasItsErrors() {
        for (SpeechError error :
                new SpeechError[] {
                    SpeechError.SERVER,
                    SpeechError.CANCELED,
                    SpeechError.NOT_AVAILABLE,
                    SpeechError.BUSY
                }) {
            assertRefused(
                    "onError " + error + ": the cloud recognizer does not report this error by itself",
                    () -> Script.cloud().error(error));
        }
        for (SpeechError error :
                new SpeechError[] {SpeechError.ENCODING, SpeechError.CANCELED}) {
            assertRefused(
                    "onError " + error + ": the device recognizer does not report this error by itself",
                    () -> Script.device().error(error));
        }
        assertRefused(
                "onError NO_VOICE: after onSpeakingBegin",
                () -> speaking().error(SpeechError.NO_VOICE));
    }

    @Test
    public void eachRecognizerHasItsDetail() {
        final ErrorDetail number = new ErrorDetailBuilder().deviceError(2).build();
        final ErrorDetail status = new ErrorDetailBuilder().httpStatus(404).build();
        final ErrorDetail recorder =
                new ErrorDetailBuilder().recorderState(RecorderState.IN_USE).build();
        assertRefused(
                "onError NETWORK: the cloud recognizer does not know: " + number,
                () -> Script.cloud().error(SpeechError.NETWORK, number));
        for (ErrorDetail detail : List.of(status, recorder)) {
            assertRefused(
                    "onError NETWORK: the device recognizer does not know: " + detail,
                    () -> Script.device().error(SpeechError.NETWORK, detail));
        }
        assertRefused(
                "onError AUDIO: only NETWORK has an HTTP status: " + status,
                () -> Script.cloud().error(SpeechError.AUDIO, status));
        assertRefused(
                "onResults: the device recognizer has no identifier of a request",
                () ->
                        Script.device()
                                .results(
                                        new RecognitionBuilder(Outcome.UNCERTAIN)
                                                .requestId("r")
                                                .build()));
    }

    @Test
    public void noEventComesAfterALimitOfTime() {
        ready().after(4700).speakingBegin();
        assertRefused(
                "onSpeakingBegin at 5001 ms: the engine's time limit is 5000 ms",
                () -> ready().after(4701).speakingBegin());
        speaking().after(19_600).recordingDone();
        assertRefused(
                "onRecordingDone at 20101 ms: the engine's time limit is 20100 ms",
                () -> speaking().after(19_601).recordingDone());
        sending().after(20_000).results(GO);
        assertRefused(
                "onResults at 21001 ms: the engine's time limit is 21000 ms",
                () -> sending().after(20_001).results(GO));
        Script.device().after(30_000).level(1).after(30_000).results(GO);
        assertRefused(
                "onPowerChanged at 30001 ms: the engine's time limit is 30000 ms",
                () -> Script.device().after(30_001).level(1));
        assertThrows(IllegalArgumentException.class, () -> Script.cloud().after(-1));
    }

    @Test
    public void aScriptWithoutAnEndGetsThatOfTheLimits() {
        assertEquals(
                List.of("onRecordingBegin at 300 ms", "onError NO_VOICE at 5000 ms"),
                describe(ready().after(60_000).build()));
        assertEquals(
                List.of(
                        "onRecordingBegin at 300 ms",
                        "onSpeakingBegin at 500 ms",
                        "onRecordingDone at 20100 ms",
                        "onError NETWORK at 40100 ms"),
                describe(speaking().build()));
        assertEquals("onError NETWORK at 21000 ms", sending().build().getEnd().toString());
        assertEquals(
                "onError NETWORK at 30007 ms",
                Script.device().after(7).recordingBegin().build().getEnd().toString());
        assertEquals(
                "onError NETWORK at 20000 ms",
                Script.device().recordingDone().build().getEnd().toString());
    }

    @Test
    public void aBuilderMayGoOnAfterAScript() {
        final Script.Builder builder = ready();
        builder.build();
        assertEquals(
                List.of("onRecordingBegin at 300 ms", "onResults at 300 ms"),
                describe(builder.results(GO).build()));
    }

    @Test
    public void verdictsThatTheEngineDoesNotReachAreRefused() {
        final RecognitionBuilder nothing = new RecognitionBuilder(Outcome.ACCEPTED);
        assertEquals(
                "the verdict without hypotheses is UNCERTAIN, not ACCEPTED",
                assertThrows(IllegalArgumentException.class, nothing::build).getMessage());
        final RecognitionBuilder one =
                new RecognitionBuilder(Outcome.UNCERTAIN)
                        .hypothesis(new HypothesisBuilder("go").build());
        assertEquals(
                "the verdict on one hypothesis without a confidence is ACCEPTED, not UNCERTAIN",
                assertThrows(IllegalArgumentException.class, one::build).getMessage());
        final RecognitionBuilder two = one.hypothesis("no", 0.5f);
        assertEquals(
                "the verdict on several hypotheses, the first without a confidence, is REJECTED,"
                        + " not UNCERTAIN",
                assertThrows(IllegalArgumentException.class, two::build).getMessage());
        for (float confidence : new float[] {-0.1f, 1.1f, Float.NaN}) {
            assertThrows(
                    IllegalArgumentException.class,
                    () -> new HypothesisBuilder("go").confidence(confidence));
        }
    }

    @Test
    public void recognitionsHoldWhatWasBuilt() {
        final Recognition recognition =
                new RecognitionBuilder(Outcome.UNCERTAIN)
                        .hypothesis("go", 0.75f)
                        .hypothesis(new HypothesisBuilder("no").build())
                        .requestId("r7")
                        .build();
        assertEquals("UNCERTAIN [go (0.75), no] of r7", recognition.toString());
    }
}
