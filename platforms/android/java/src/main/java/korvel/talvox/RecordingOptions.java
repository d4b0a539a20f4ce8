package korvel.talvox;

import android.media.AudioDeviceInfo;
import java.util.Objects;
import korvel.core.AudioRecorderBackend;
import korvel.core.SoundInput;
import org.jspecify.annotations.Nullable;

/**
 * What one recognition records from. Immutable. The device recognizer records by itself: for it they
 * have no effect.
 */
public final class RecordingOptions {
    private static final RecordingOptions DEFAULT = new RecordingOptions(null, null, null);

    private final SoundInput.@Nullable Factory input;
    private final @Nullable Integer audioSource;
    private final @Nullable AudioDeviceInfo device;

    private RecordingOptions(
            SoundInput.@Nullable Factory input,
            @Nullable Integer audioSource,
            @Nullable AudioDeviceInfo device) {
        this.input = input;
        this.audioSource = audioSource;
        this.device = device;
    }

    /**
     * The device's microphone, as a recognition without options uses it: with the audio source of
     * {@link TalvoxSettings#SESSION_MODE} and the device that the system chooses.
     */
    public static RecordingOptions ofMicrophone() {
        return DEFAULT;
    }

    /**
     * A sound input of the application's own: a file, a capture, the stream of another application.
     *
     * @param input opens it, on a thread of the recognition's, when that starts
     */
    public static RecordingOptions ofInput(SoundInput.Factory input) {
        return new RecordingOptions(Objects.requireNonNull(input, "input"), null, null);
    }

    /**
     * The microphone with another audio source. One that the device does not have ends the
     * recognition with {@link SpeechError#AUDIO} and {@link RecorderState#UNAVAILABLE}.
     *
     * @param source one of {@link android.media.MediaRecorder.AudioSource}
     * @throws IllegalStateException if these are the options of an input of the application's own
     */
    public RecordingOptions withAudioSource(int source) {
        checkMicrophone("withAudioSource");
        return new RecordingOptions(null, source, device);
    }

    /**
     * The microphone of a certain device, such as a headset. Where the system refuses it, the log
     * says so, and the system chooses.
     *
     * @param preferred an input device of {@link android.media.AudioManager#getDevices}
     * @throws IllegalStateException if these are the options of an input of the application's own
     */
    public RecordingOptions withPreferredDevice(AudioDeviceInfo preferred) {
        checkMicrophone("withPreferredDevice");
        return new RecordingOptions(
                null, audioSource, Objects.requireNonNull(preferred, "preferred"));
    }

    private void checkMicrophone(String operation) {
        if (input != null) {
            throw new IllegalStateException(operation + ": the input is the application's own");
        }
    }

    /** The input of the application's own; null for the microphone. */
    public SoundInput.@Nullable Factory getInput() {
        return input;
    }

    /** The audio source; null for that of the session's mode. */
    public @Nullable Integer getAudioSource() {
        return audioSource;
    }

    /** The preferred device; null for the system's choice. */
    public @Nullable AudioDeviceInfo getPreferredDevice() {
        return device;
    }

    /** What the recorder opens; null for what is installed for all recognitions. */
    SoundInput.@Nullable Factory getInputs() {
        if (input != null || (audioSource == null && device == null)) {
            return input;
        }
        return AudioRecorderBackend.microphone(audioSource, device);
    }
}
