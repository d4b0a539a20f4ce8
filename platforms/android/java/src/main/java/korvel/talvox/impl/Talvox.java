package korvel.talvox.impl;

import android.os.Bundle;
import java.util.ArrayList;

/**
 * The native engine. Applications use {@link korvel.talvox.TalvoxEngine}.
 *
 * <p>Any thread may call; each call holds the engine's event lock and does not wait for the network
 * or a device. The engine is one per process, so its handle is never released.
 */
public final class Talvox {
    static {
        NativeLibrary.load();
    }

    private Talvox() {}

    public static native String getVersion();

    public static native long getHandle();

    public static native Bundle getSettings(long engine);

    public static native void updateSettings(long engine, Bundle settings);

    public static native void updateSettingsFromXml(long engine, String xml);

    /**
     * @param path of a PEM file with authorities to trust beside the platform's, empty for none
     */
    public static native void setCertificateFile(String path);

    public static native boolean isRecognitionAvailable(long engine, Bundle settings);

    public static native ArrayList<String> getAvailableLanguages(long engine);
}
