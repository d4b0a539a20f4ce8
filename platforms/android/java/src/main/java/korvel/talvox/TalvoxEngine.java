package korvel.talvox;

import android.content.Context;
import java.io.File;
import java.util.List;
import java.util.Objects;
import java.util.concurrent.Executor;
import korvel.core.CoreApplication;
import korvel.talvox.impl.EngineBackend;
import korvel.talvox.impl.PlatformRecognizer;
import korvel.talvox.impl.Talvox;
import org.jspecify.annotations.Nullable;

/**
 * The speech-recognition engine. There is one per process, which lives as long as the process.
 *
 * <p>Any thread may call any method; none waits for the network or a device.
 */
public final class TalvoxEngine {
    private static @Nullable TalvoxEngine instance;

    /** Takes the place of the native engine in an application's tests. */
    private static volatile @Nullable TalvoxEngine substitute;

    private final EngineBackend backend;

    TalvoxEngine(EngineBackend backend) {
        this.backend = backend;
    }

    /**
     * The engine. The first call loads the native library and begins to watch the state of the
     * network; the others do neither.
     *
     * @param context any context of the application; only its application context is kept
     * @throws UnsatisfiedLinkError if the application was built without the library for this
     *     device's processor
     */
    public static TalvoxEngine getInstance(Context context) {
        Objects.requireNonNull(context, "context");
        final TalvoxEngine other = substitute;
        if (other != null) {
            return other;
        }
        CoreApplication.install(context);
        PlatformRecognizer.queryLanguages();
        final long handle = Talvox.getHandle();
        synchronized (TalvoxEngine.class) {
            if (instance == null) {
                instance = new TalvoxEngine(new NativeBackend(handle));
            }
            return instance;
        }
    }

    /** For the test kit: null for the native engine. */
    static void substitute(@Nullable TalvoxEngine engine) {
        substitute = engine;
    }

    /** The engine's version, for example "133". */
    public String getVersion() {
        return backend.getVersion();
    }

    /**
     * The engine's settings, all keys set. {@link TalvoxSettings#EVENTS_LOGGING} says whether usage
     * events are collected, however that was switched.
     */
    public TalvoxSettings getSettings() {
        return backend.getSettings();
    }

    /**
     * Changes the engine's settings: those that are set here. They count for what starts from then
     * on; a recognition under way keeps its own, but for the confidences, which are read when its
     * results arrive, and the verbosity.
     */
    public void updateSettings(TalvoxSettings settings) {
        backend.updateSettings(Objects.requireNonNull(settings, "settings"));
    }

    /**
     * Changes the engine's settings to what an XML document says under {@code
     * /startup/features/voice}. What cannot be read there is logged and changes nothing; of a
     * document with an error, what stands before the error counts. The values are not checked.
     * Otherwise as {@link #updateSettings}.
     */
    public void updateSettingsFromXml(String xml) {
        backend.updateSettingsFromXml(Objects.requireNonNull(xml, "xml"));
    }

    /**
     * Trusts the certificate authorities of a file beside those of the platform for https
     * connections that are opened from now on, to the gateway and to the endpoint of the usage log:
     * for a private authority. It holds until the process ends. The file is checked on the calling
     * thread, read again with the first connection and after a certificate was refused, so it must
     * stay where it is.
     *
     * @param file certificates in PEM form; null for the authorities of the platform alone
     * @throws IllegalArgumentException if the file is missing, cannot be read, holds no certificate
     *     or a broken one; what was trusted before stays trusted
     */
    public void setCertificateFile(@Nullable File file) {
        backend.setCertificateFile(file);
    }

    /**
     * Whether a recognition with these settings would find a recognizer: only {@link
     * TalvoxSettings#ASR_POLICY} and {@link TalvoxSettings#ASR_OVERRIDE} count. Neither the network
     * nor the gateway is asked.
     */
    public boolean isRecognitionAvailable(TalvoxSettings settings) {
        return backend.isRecognitionAvailable(Objects.requireNonNull(settings, "settings"));
    }

    /**
     * The languages that can be recognised, sorted, each once. Those of the device recognizer
     * are asked for when the engine is created and join as soon as it has answered.
     */
    public List<String> getAvailableLanguages() {
        return backend.getAvailableLanguages();
    }

    /**
     * A recognition whose events are delivered on the main looper; otherwise as {@link
     * #createRecognizer(TalvoxSettings, RecognitionListener, Executor)}.
     */
    public TalvoxRecognizer createRecognizer(
            TalvoxSettings settings, RecognitionListener listener) {
        return createRecognizer(settings, listener, backend.getMainExecutor());
    }

    /**
     * A recognition that records from the microphone, not started yet; otherwise as {@link
     * #createRecognizer(TalvoxSettings, RecordingOptions, RecognitionListener, Executor)}.
     */
    public TalvoxRecognizer createRecognizer(
            TalvoxSettings settings, RecognitionListener listener, Executor executor) {
        return createRecognizer(settings, RecordingOptions.ofMicrophone(), listener, executor);
    }

    /**
     * A recognition, not started yet.
     *
     * @param settings what differs from the engine's settings, see {@link
     *     TalvoxSettings#forRecognition}
     * @param recording what it records from
     * @param listener hears the events
     * @param executor runs the listener. One that runs it at once, on the calling thread, has it run
     *     on the engine's event thread: then the listener must not block at all. An event that it
     *     refuses by throwing is logged and lost, even the last one; the rest still comes
     * @throws IllegalArgumentException if a setting is {@linkplain SettingKey#isEngineOnly of the
     *     engine only}
     */
    public TalvoxRecognizer createRecognizer(
            TalvoxSettings settings,
            RecordingOptions recording,
            RecognitionListener listener,
            Executor executor) {
        Objects.requireNonNull(settings, "settings").checkForRecognition();
        return new TalvoxRecognizer(
                backend,
                settings,
                Objects.requireNonNull(recording, "recording"),
                Objects.requireNonNull(listener, "listener"),
                Objects.requireNonNull(executor, "executor"));
    }
}
