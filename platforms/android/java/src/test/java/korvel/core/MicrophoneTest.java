package korvel.core;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertThrows;
import static org.robolectric.Shadows.shadowOf;

import android.Manifest;
import android.media.MediaRecorder;
import java.io.IOException;
import korvel.talvox.support.KitTest;
import org.junit.Test;

/** Why the microphone cannot be opened. */
public class MicrophoneTest extends KitTest {
    private static SessionRecording.State open(int sampleRateHz) {
        return RecordingException.getState(
                assertThrows(IOException.class, () -> Microphone.open(sampleRateHz, 100, MediaRecorder.AudioSource.MIC, null)));
    }

    @Test
    public void aRateThatTheDeviceDoesNotHave() {
        assertEquals(SessionRecording.State.UNAVAILABLE, open(1));
    }

    @Test
    public void noPermission() {
        CoreApplication.install(application);
        shadowOf(application).denyPermissions(Manifest.permission.RECORD_AUDIO);
        assertEquals(SessionRecording.State.NO_PERMISSION, open(16000));
    }
}
