package korvel.talvox;

import android.content.Context;
import android.os.Bundle;
import android.os.Handler;
import android.os.Looper;
import java.io.File;
import java.util.ArrayList;
import java.util.List;
import java.util.Objects;
import java.util.TreeSet;
import java.util.concurrent.Executor;
import korvel.core.CoreApplication;
import korvel.talvox.impl.PlatformRecognizer;
import korvel.talvox.impl.Talvox;
import korvel.talvox.util.LogCollector;

/**
 * The speech-recognition engine. There is one per process, which lives as long as the process.
 *
 * <p>Any thread may call any method; none waits for the network or a device.
 */
public final class TalvoxEngine {
    private static TalvoxEngine instance;

    private final long handle;

    private TalvoxEngine(long handle) {
        this.handle = handle;
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
        CoreApplication.install(context);
        PlatformRecognizer.queryLanguages();
        final long handle = Talvox.getHandle();
        synchronized (TalvoxEngine.class) {
            if (instance == null) {
                instance = new TalvoxEngine(handle);
            }
            return instance;
        }
    }

    long getHandle() {
        return handle;
    }

    /** The engine's version, for example "133". */
    public String getVersion() {
        return Talvox.getVersion();
    }

    /**
     * The engine's settings, all keys set. {@link TalvoxSettings#EVENTS_LOGGING} says whether usage
     * events are collected, however that was switched.
     */
    public TalvoxSettings getSettings() {
        final Bundle settings = Talvox.getSettings(handle);
        settings.putAll(eventsLogging());
        return TalvoxSettings.fromBundle(settings);
    }

    /**
     * Changes the engine's settings: those that are set here. They count for what starts from then
     * on; a recognition under way keeps its own, but for the confidences, which are read when its
     * results arrive, and the verbosity.
     */
    public void updateSettings(TalvoxSettings settings) {
        Talvox.updateSettings(handle, settings.toBundle());
        switchEventsLogging(settings);
    }

    /**
     * Changes the engine's settings to what an XML document says under {@code
     * /startup/features/voice}. What cannot be read there is logged and changes nothing; of a
     * document with an error, what stands before the error counts. The values are not checked.
     * Otherwise as {@link #updateSettings}.
     */
    public void updateSettingsFromXml(String xml) {
        Objects.requireNonNull(xml, "xml");
        // The document need not set this one; if it does not, the collector stays as it is.
        Talvox.updateSettings(handle, eventsLogging());
        Talvox.updateSettingsFromXml(handle, xml);
        switchEventsLogging(TalvoxSettings.fromBundle(Talvox.getSettings(handle)));
    }

    /** The state of the collector as a setting. */
    private static Bundle eventsLogging() {
        return TalvoxSettings.builder()
                .set(
                        TalvoxSettings.EVENTS_LOGGING,
                        LogCollector.isLoggingEnabled()
                                ? EventsLogging.ENABLED
                                : EventsLogging.DISABLED)
                .build()
                .toBundle();
    }

    /** Switches the collector where the settings say how. */
    private static void switchEventsLogging(TalvoxSettings settings) {
        final EventsLogging wanted = settings.get(TalvoxSettings.EVENTS_LOGGING);
        if (wanted != null) {
            LogCollector.setLoggingEnabled(wanted == EventsLogging.ENABLED);
        }
    }

    /**
     * Trusts the certificate authorities of a file, and no others, for https connections that are
     * opened from now on, to the gateway and to the endpoint of the usage log: for a private
     * authority. It holds until the process ends. The file is checked on the calling thread and read
     * again with new connections, so it must stay where it is.
     *
     * @param file certificates in PEM form; null for the authorities of the system
     * @throws IllegalArgumentException if the file is missing, cannot be read, holds no certificate
     *     or a broken one; what was trusted before stays trusted
     */
    public void setCertificateFile(File file) {
        if (file != null) {
            CertificateFile.check(file);
        }
        Talvox.setCertificateFile(file == null ? "" : file.getAbsolutePath());
    }

    /**
     * Whether a recognition with these settings would find a recognizer: only {@link
     * TalvoxSettings#ASR_POLICY} and {@link TalvoxSettings#ASR_OVERRIDE} count. Neither the network
     * nor the gateway is asked.
     */
    public boolean isRecognitionAvailable(TalvoxSettings settings) {
        return Talvox.isRecognitionAvailable(handle, settings.toBundle());
    }

    /**
     * The languages that can be recognised, sorted, each once. Those of the device recognizer
     * are asked for when the engine is created and join as soon as it has answered.
     */
    public List<String> getAvailableLanguages() {
        final TreeSet<String> languages = new TreeSet<>(Talvox.getAvailableLanguages(handle));
        languages.addAll(PlatformRecognizer.getAvailableLanguages());
        return new ArrayList<>(languages);
    }

    /**
     * A recognition whose events are delivered on the main looper; otherwise as {@link
     * #createRecognizer(TalvoxSettings, RecognitionListener, Executor)}.
     */
    public TalvoxRecognizer createRecognizer(
            TalvoxSettings settings, RecognitionListener listener) {
        final Handler main = new Handler(Looper.getMainLooper());
        return createRecognizer(settings, listener, main::post);
    }

    /**
     * A recognition, not started yet.
     *
     * @param settings what differs from the engine's settings, see {@link
     *     TalvoxSettings#forRecognition}
     * @param listener hears the events
     * @param executor runs the listener. One that runs it at once, on the calling thread, has it run
     *     on the engine's event thread: then the listener must not block at all. An event that it
     *     refuses by throwing is logged and lost, even the last one; the rest still comes
     * @throws IllegalArgumentException if a setting is {@linkplain SettingKey#isEngineOnly of the
     *     engine only}
     */
    public TalvoxRecognizer createRecognizer(
            TalvoxSettings settings, RecognitionListener listener, Executor executor) {
        Objects.requireNonNull(settings, "settings").checkForRecognition();
        return new TalvoxRecognizer(
                this,
                settings,
                Objects.requireNonNull(listener, "listener"),
                Objects.requireNonNull(executor, "executor"));
    }
}
