package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
import java.util.ArrayList;
import java.util.Collections;
import java.util.List;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.support.EngineTestCase;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

/**
 * Engine settings that do not fit their table, as only an application's own native code can make
 * them: each entry point that copies them reports the broken invariant and goes on.
 */
public class NonConformingSettingsTest extends EngineTestCase {
    @Before
    public void breakSettings() {
        SettingsProbe.addUnknownSetting();
        expectAssertions(1);
    }

    @After
    public void mendSettings() {
        SettingsProbe.restoreDefaults();
    }

    private static Bundle inTurkish() {
        final Bundle settings = new Bundle();
        settings.putString(TalvoxSettings.LANGUAGE.getName(), "tr-TR");
        return settings;
    }

    @Test
    public void anUpdateIsInstalled() {
        Talvox.updateSettings(Talvox.getHandle(), inTurkish());
        assertLogged(
                "assertion failed: newSettings->conformsTo(Talvox::Settings::bundleSpecs) "
                        + "(platforms/android/jni/RecognizerService:");
        assertEquals(
                "tr-TR",
                Talvox.getSettings(Talvox.getHandle())
                        .getString(TalvoxSettings.LANGUAGE.getName()));
    }

    @Test
    public void theAvailabilityIsAnswered() {
        assertTrue(Talvox.isRecognitionAvailable(Talvox.getHandle(), inTurkish()));
    }

    @Test
    public void aSessionStarts() {
        final List<Integer> errors = Collections.synchronizedList(new ArrayList<>());
        final NativeHandle session =
                Recognizer.start(
                        Talvox.getHandle(),
                        inTurkish(),
                        new SilentEvents() {
                            @Override
                            public void onError(int code) {
                                errors.add(code);
                            }
                        });
        Recognizer.cancel(session);
        session.close();
        // Without an address and a uuid it is over at once.
        assertEquals(Collections.singletonList(3), errors);
    }
}
