package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNotEquals;
import static org.junit.Assert.assertThrows;

import korvel.talvox.support.KitTest;
import org.junit.Test;

public class RecognitionTest extends KitTest {
    private static Recognition sample() {
        return Recognition.fromNative(
                1, new String[] {"go forward", "go"}, new float[] {0.95f, -1.0f}, "r1");
    }

    @Test
    public void isAValue() {
        final Recognition recognition = sample();
        assertEquals(Outcome.ACCEPTED, recognition.getOutcome());
        assertEquals("r1", recognition.getRequestId());
        assertEquals("go forward", recognition.getHypotheses().get(0).getText());
        assertEquals(0.95f, recognition.getHypotheses().get(0).getConfidence(), 0);
        assertFalse(recognition.getHypotheses().get(1).hasConfidence());
        assertEquals(sample(), recognition);
        assertEquals(sample().hashCode(), recognition.hashCode());
        assertNotEquals(
                Recognition.fromNative(2, new String[0], new float[0], "r1"), recognition);
        assertEquals("ACCEPTED [go forward (0.95), go] of r1", recognition.toString());
        assertThrows(
                UnsupportedOperationException.class, () -> recognition.getHypotheses().clear());
    }

    @Test
    public void codesBecomeEnums() {
        assertEquals(Outcome.REJECTED, Outcome.fromCode(0));
        assertEquals(Outcome.ACCEPTED, Outcome.fromCode(1));
        assertEquals(Outcome.UNCERTAIN, Outcome.fromCode(2));
        final String[] names = {
            "ErrorUnknown", "ErrorAudio", "ErrorEncoding", "ErrorNetwork", "ErrorServer",
            "ErrorCanceled", "ErrorNoVoice", "ErrorNotAvailable", "ErrorBusy"
        };
        assertEquals(names.length, SpeechError.values().length);
        for (int code = 0; code < names.length; code++) {
            assertEquals(names[code], SpeechError.fromCode(code).getText());
            assertEquals(code, SpeechError.fromCode(code).getCode());
        }
        assertEquals(SpeechError.UNKNOWN, SpeechError.fromCode(9));
        assertEquals(SpeechError.UNKNOWN, SpeechError.fromCode(-1));
    }
}
