package korvel.talvox.support;

import static org.robolectric.Shadows.shadowOf;

import android.content.Context;
import android.net.ConnectivityManager;
import android.net.Network;
import android.net.NetworkCapabilities;
import org.robolectric.shadows.ShadowConnectivityManager;
import org.robolectric.shadows.ShadowNetworkCapabilities;

/** The network of the device, as a test sets it. */
public final class Connectivity {
    private Connectivity() {}

    public static void wifi(Context context) {
        change(context, NetworkCapabilities.TRANSPORT_WIFI);
    }

    public static void mobile(Context context) {
        change(context, NetworkCapabilities.TRANSPORT_CELLULAR);
    }

    private static void change(Context context, int transport) {
        final ConnectivityManager manager = context.getSystemService(ConnectivityManager.class);
        final ShadowConnectivityManager shadow = shadowOf(manager);
        final Network network = manager.getActiveNetwork();
        final NetworkCapabilities capabilities = ShadowNetworkCapabilities.newInstance();
        shadowOf(capabilities).addTransportType(transport);
        shadowOf(capabilities).addCapability(NetworkCapabilities.NET_CAPABILITY_INTERNET);
        shadow.setNetworkCapabilities(network, capabilities);
        KitTest.onMain(
                () -> {
                    for (ConnectivityManager.NetworkCallback callback :
                            shadow.getNetworkCallbacks()) {
                        callback.onCapabilitiesChanged(network, capabilities);
                    }
                });
    }
}
