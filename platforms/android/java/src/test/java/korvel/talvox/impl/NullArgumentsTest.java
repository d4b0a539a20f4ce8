package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import android.content.Context;
import android.media.AudioDeviceInfo;
import android.os.Bundle;
import java.io.File;
import java.util.Collections;
import java.util.concurrent.Executor;
import korvel.core.SoundInput;
import korvel.talvox.RecognitionListener;
import korvel.talvox.RecordingOptions;
import korvel.talvox.SettingKey;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.proximity.ProximityGestureRecognizer;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.NullArguments;
import korvel.talvox.support.PublicApi;
import korvel.talvox.util.UsageLog;
import org.junit.Before;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;
import org.robolectric.shadows.AudioDeviceInfoBuilder;

/**
 * Every argument of the public API that must not be null is refused when it is, by its name: each
 * public method and constructor is called with one null after the other.
 */
public class NullArgumentsTest extends EngineTestCase {
    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    private final NullArguments nulls = new NullArguments();

    @Before
    public void makeSamples() {
        final TalvoxSettings settings = TalvoxSettings.forRecognition().build();
        nulls.addSample(Context.class, application);
        nulls.addSample(Bundle.class, new Bundle());
        nulls.addSample(File.class, folder.getRoot());
        nulls.addSample(Executor.class, (Executor) Runnable::run);
        nulls.addSample(RecognitionListener.class, new Events());
        nulls.addSample(SettingKey.class, TalvoxSettings.LANGUAGE);
        nulls.addSample(TalvoxSettings.class, settings);
        nulls.addSample(TalvoxSettings.Builder.class, settings.toBuilder());
        nulls.addSample(TalvoxEngine.class, engine);
        nulls.addSample(
                ProximityGestureRecognizer.Listener.class,
                (ProximityGestureRecognizer.Listener) gesture -> {});
        nulls.addSample(Runnable.class, (Runnable) () -> {});
        nulls.addSample(RecordingOptions.class, RecordingOptions.ofMicrophone());
        nulls.addSample(
                SoundInput.Factory.class, (SoundInput.Factory) (rate, length, mode) -> null);
        nulls.addSample(AudioDeviceInfo.class, AudioDeviceInfoBuilder.newBuilder().build());
    }

    @Test
    public void nullIsRefusedByName() throws Exception {
        try (UsageLog log = UsageLog.open("nulls");
                ProximityGestureRecognizer gestures =
                        new ProximityGestureRecognizer(gesture -> {}, Runnable::run)) {
            nulls.addSample(UsageLog.class, log);
            nulls.addSample(ProximityGestureRecognizer.class, gestures);
            for (Class<?> type : PublicApi.findClasses()) {
                nulls.checkCallsOf(type);
            }
        }
        assertEquals(Collections.emptyList(), nulls.getFaults());
        assertTrue("only " + nulls.getCalls() + " calls", nulls.getCalls() >= 30);
    }
}
