package korvel.talvox.impl;

import java.io.File;
import java.util.List;
import java.util.concurrent.Executor;
import korvel.talvox.ErrorDetail;
import korvel.talvox.Recognition;
import korvel.talvox.RecordingOptions;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxSettings;
import org.jspecify.annotations.Nullable;

/**
 * What lies below {@code TalvoxEngine} and its recognizers: the native engine, or the scripted one of
 * the test kit. Any thread may call any method; none blocks. What is null has been refused above.
 */
public interface EngineBackend {
    /**
     * Receives the events of one session, one at a time. They may come inside the call that causes
     * them, before {@link #start} has returned as well.
     */
    interface Events {
        void onRecordingBegin();

        void onSpeakingBegin();

        void onRecordingDone();

        void onPowerChanged(float power);

        void onBufferReceived(byte[] buffer);

        void onError(SpeechError error, ErrorDetail detail);

        void onResults(Recognition recognition);
    }

    /** A session that has started. All calls are without effect after its last event. */
    interface Running {
        void stop();

        void cancel();

        /** Ends it without a further event; called once. */
        void close();
    }

    String getVersion();

    TalvoxSettings getSettings();

    void updateSettings(TalvoxSettings changes);

    void updateSettingsFromXml(String xml);

    /** Null for the authorities of the platform alone. */
    void setCertificateFile(@Nullable File file);

    boolean isRecognitionAvailable(TalvoxSettings settings);

    /** Sorted, each once; the caller's own. */
    List<String> getAvailableLanguages();

    /** Runs listeners that have no executor of their own. */
    Executor getMainExecutor();

    /**
     * Starts a session.
     *
     * @param settings what differs from the engine's settings
     * @param recording what it records from
     * @throws RuntimeException if there is no memory for it; no event comes then
     */
    Running start(TalvoxSettings settings, RecordingOptions recording, Events events);
}
