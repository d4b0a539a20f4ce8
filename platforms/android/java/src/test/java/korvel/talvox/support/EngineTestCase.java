package korvel.talvox.support;

import android.os.Bundle;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.impl.Talvox;
import org.junit.After;
import org.junit.Before;

/** A test with the real native engine, whose settings are its defaults when the test begins. */
public abstract class EngineTestCase extends KitTest {
    protected static final String UUID = "0123456789abcdef0123456789abcdef";

    protected TalvoxEngine engine;
    private Bundle settingsBefore;

    @Before
    public final void createEngine() {
        engine = TalvoxEngine.getInstance(application);
        settingsBefore = Talvox.getSettings(Talvox.getHandle());
    }

    @After
    public final void restoreSettings() {
        Talvox.updateSettings(Talvox.getHandle(), settingsBefore);
    }

    /** Tells the engine where the gateway is. */
    protected final void useGateway(String url) {
        engine.updateSettings(
                TalvoxSettings.builder()
                        .set(TalvoxSettings.URL, url)
                        .set(TalvoxSettings.UUID, UUID)
                        .set(TalvoxSettings.LANGUAGE, "en-US")
                        .build());
    }

    /** Takes the gateway's address from the engine. */
    protected static void forgetGateway() {
        final Bundle nowhere = new Bundle();
        nowhere.putString(TalvoxSettings.URL.getName(), "");
        Talvox.updateSettings(Talvox.getHandle(), nowhere);
    }
}
