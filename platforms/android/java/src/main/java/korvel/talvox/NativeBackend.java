package korvel.talvox;

import android.os.Bundle;
import android.os.Handler;
import android.os.Looper;
import java.io.File;
import java.util.ArrayList;
import java.util.List;
import java.util.TreeSet;
import java.util.concurrent.Executor;
import korvel.talvox.impl.CertificateFile;
import korvel.talvox.impl.EngineBackend;
import korvel.talvox.impl.PlatformRecognizer;
import korvel.talvox.impl.Talvox;
import korvel.talvox.util.LogCollector;
import org.jspecify.annotations.Nullable;

/** The native engine. */
final class NativeBackend implements EngineBackend {
    private final long handle;

    NativeBackend(long handle) {
        this.handle = handle;
    }

    @Override
    public String getVersion() {
        return Talvox.getVersion();
    }

    @Override
    public TalvoxSettings getSettings() {
        final Bundle settings = Talvox.getSettings(handle);
        settings.putAll(eventsLogging());
        return TalvoxSettings.fromBundle(settings);
    }

    @Override
    public void updateSettings(TalvoxSettings changes) {
        Talvox.updateSettings(handle, changes.toBundle());
        switchEventsLogging(changes);
    }

    @Override
    public void updateSettingsFromXml(String xml) {
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

    @Override
    public void setCertificateFile(@Nullable File file) {
        CertificateFile.use(file);
    }

    @Override
    public boolean isRecognitionAvailable(TalvoxSettings settings) {
        return Talvox.isRecognitionAvailable(handle, settings.toBundle());
    }

    @Override
    public List<String> getAvailableLanguages() {
        final TreeSet<String> languages = new TreeSet<>(Talvox.getAvailableLanguages(handle));
        languages.addAll(PlatformRecognizer.getAvailableLanguages());
        return new ArrayList<>(languages);
    }

    @Override
    public Executor getMainExecutor() {
        final Handler main = new Handler(Looper.getMainLooper());
        return main::post;
    }

    @Override
    public Running start(TalvoxSettings settings, RecordingOptions recording, Events events) {
        return NativeSession.start(handle, settings, recording, events);
    }
}
