package korvel.talvox.impl;

import android.os.Bundle;
import java.util.ArrayList;

/** The engine, as an application without the kit declares it. */
public final class Talvox {
    private Talvox() {}

    public static native String getVersion();

    public static native long getHandle();

    public static native Bundle getSettings(long engine);

    public static native void updateSettings(long engine, Bundle settings);

    public static native void updateSettingsFromXml(long engine, String xml);

    public static native boolean isRecognitionAvailable(long engine, Bundle settings);

    public static native ArrayList<String> getAvailableLanguages(long engine);
}
