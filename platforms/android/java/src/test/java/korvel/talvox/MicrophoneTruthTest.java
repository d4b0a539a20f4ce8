package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.robolectric.Shadows.shadowOf;

import android.Manifest;
import android.media.AudioFormat;
import android.media.AudioManager;
import android.media.AudioRecordingConfiguration;
import android.media.MediaRecorder;
import android.media.audiofx.AudioEffect;
import java.nio.ByteBuffer;
import java.util.Arrays;
import java.util.Collections;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.Microphone;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;
import org.robolectric.shadows.ShadowAudioManager;
import org.robolectric.shadows.ShadowAudioRecord;

/** A quiet room, a microphone that delivers only zeros and one that the system silences differ. */
public class MicrophoneTruthTest extends EngineTestCase {
    private static final TalvoxSettings NOTHING = TalvoxSettings.forRecognition().build();
    private static final String NO_SPEECH = "no speech within 5 s";
    private static final String ZEROS_LOGGED = "the microphone delivers only zeros";
    private static final String SILENCED_LOGGED = "the system silences the microphone";

    /** Of the recordings of the framework classes without a device. */
    private static final int AUDIO_SESSION = 0;

    private final Details events = new Details();
    private final Microphone microphone = new Microphone(16000, 1);
    private ShadowAudioManager system;

    private static final class Details extends Events {
        volatile ErrorDetail detail;

        @Override
        public void onError(SpeechError error, ErrorDetail value) {
            detail = value;
            super.onError(error, value);
        }
    }

    /** Keeps the time of a microphone and delivers zeros. */
    private final class Zeros implements ShadowAudioRecord.AudioRecordSource {
        @Override
        public int readInByteArray(byte[] target, int offset, int size, boolean isBlocking) {
            final int read = microphone.readInByteArray(target, offset, size, isBlocking);
            Arrays.fill(target, offset, offset + read, (byte) 0);
            return read;
        }

        @Override
        public int readInShortArray(short[] target, int offset, int size, boolean isBlocking) {
            throw new UnsupportedOperationException();
        }

        @Override
        public int readInDirectBuffer(ByteBuffer target, int size, boolean isBlocking) {
            throw new UnsupportedOperationException();
        }
    }

    @Before
    public void plugIn() {
        Connectivity.wifi(application);
        useGateway("http://127.0.0.1:9/");
        microphone.plugIn();
        system = shadowOf(application.getSystemService(AudioManager.class));
    }

    @After
    public void unplug() {
        microphone.close();
        system.setActiveRecordingConfigurations(Collections.emptyList(), false);
    }

    private void record(int session, boolean isSilenced) {
        final AudioFormat format = new AudioFormat.Builder().setSampleRate(16000).build();
        final AudioEffect.Descriptor[] effects = {};
        system.setActiveRecordingConfigurations(
                Collections.singletonList(
                        new AudioRecordingConfiguration(
                                0, session, MediaRecorder.AudioSource.MIC, format, format, 0, "",
                                0, isSilenced, MediaRecorder.AudioSource.MIC, effects, effects)),
                false);
    }

    private void expectNoVoice(RecorderState state, String reason) throws InterruptedException {
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            recognizer.start();
            assertEquals("error NO_VOICE", events.end());
        }
        assertEquals(new ErrorDetail(reason, null, null, state), events.detail);
    }

    @Test
    public void aQuietRoom() throws Exception {
        record(AUDIO_SESSION, false);
        expectNoVoice(RecorderState.RECORDING, NO_SPEECH);
        assertFalse(log().contains(ZEROS_LOGGED));
        assertFalse(log().contains(SILENCED_LOGGED));
    }

    @Test
    public void onlyZeros() throws Exception {
        ShadowAudioRecord.setSource(new Zeros());
        expectNoVoice(RecorderState.ONLY_ZEROS, NO_SPEECH + ": the microphone delivers only zeros");
        assertLogged(ZEROS_LOGGED);
        assertFalse(log().contains(SILENCED_LOGGED));
    }

    @Test
    public void silencedByTheSystem() throws Exception {
        record(AUDIO_SESSION, true);
        ShadowAudioRecord.setSource(new Zeros());
        expectNoVoice(RecorderState.SILENCED, NO_SPEECH + ": the system silences the microphone");
        assertLogged(SILENCED_LOGGED);
    }

    @Test
    public void aRecordingOfAnotherApplicationThatIsSilenced() throws Exception {
        record(AUDIO_SESSION + 1, true);
        expectNoVoice(RecorderState.RECORDING, NO_SPEECH);
    }

    @Test
    public void silencedForAWhile() throws Exception {
        record(AUDIO_SESSION, true);
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            recognizer.start();
            assertEquals("recordingBegin", events.next());
            record(AUDIO_SESSION, false);
            assertEquals("error NO_VOICE", events.end());
        }
        assertEquals(
                new ErrorDetail(NO_SPEECH, null, null, RecorderState.RECORDING), events.detail);
        assertLogged("the system silences the microphone no longer");
    }

    @Test
    public void aPermissionThatIsWithdrawnDuringTheRecording() throws Exception {
        try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            recognizer.start();
            assertEquals("recordingBegin", events.next());
            shadowOf(application).denyPermissions(Manifest.permission.RECORD_AUDIO);
            assertEquals("error AUDIO", events.end());
        }
        assertEquals(
                new ErrorDetail(
                        "the recorder failed: the permission RECORD_AUDIO was withdrawn during the"
                                + " recording",
                        null,
                        null,
                        RecorderState.NO_PERMISSION),
                events.detail);
        assertLogged("the permission RECORD_AUDIO was withdrawn during the recording");
    }
}
