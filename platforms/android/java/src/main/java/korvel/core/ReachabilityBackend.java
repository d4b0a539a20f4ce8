package korvel.core;

import android.content.Context;
import android.net.ConnectivityManager;
import android.net.Network;
import android.net.NetworkCapabilities;
import android.util.Log;
import org.jspecify.annotations.Nullable;

/** Tells the native library how the network is reached: by the default network's transport. */
final class ReachabilityBackend extends ConnectivityManager.NetworkCallback {
    static final int UNREACHABLE = 0;
    static final int WIFI = 1;
    static final int METERED = 2;

    /** The system's own view, where Android does not tell. */
    private static final int UNKNOWN = -1;

    private static @Nullable ConnectivityManager watched;
    private static @Nullable Context watchedFor;
    private static @Nullable ReachabilityBackend watcher;

    private ReachabilityBackend() {}

    /**
     * Called by the native library. Watches from now on, instead of what was watched before; the
     * same application is watched once, however often this is called.
     */
    private static synchronized void start(Context context) {
        if (watcher != null && watchedFor == context) {
            return;
        }
        stop();
        final Object service = context.getSystemService(Context.CONNECTIVITY_SERVICE);
        if (!(service instanceof ConnectivityManager)) {
            onReachabilityChangedInternal(UNKNOWN);
            return;
        }
        final ConnectivityManager manager = (ConnectivityManager) service;
        try {
            final ReachabilityBackend callback = new ReachabilityBackend();
            onReachabilityChangedInternal(classify(manager));
            manager.registerDefaultNetworkCallback(callback);
            watched = manager;
            watchedFor = context;
            watcher = callback;
        } catch (RuntimeException refused) {
            // No permission ACCESS_NETWORK_STATE, or too many callbacks in this application.
            Log.w(LogBackend.TAG, "The state of the network is not watched", refused);
            onReachabilityChangedInternal(UNKNOWN);
        }
    }

    private static void stop() {
        if (watched != null && watcher != null) {
            try {
                watched.unregisterNetworkCallback(watcher);
            } catch (IllegalArgumentException unknown) {
                // The manager has forgotten it by itself.
            }
            watcher = null;
        }
    }

    private static int classify(ConnectivityManager manager) {
        final Network network = manager.getActiveNetwork();
        return network == null ? UNREACHABLE : classify(manager.getNetworkCapabilities(network));
    }

    private static int classify(@Nullable NetworkCapabilities capabilities) {
        if (capabilities == null) {
            return METERED; // there is a network, of a kind that nobody knows
        }
        final boolean isWifi =
                capabilities.hasTransport(NetworkCapabilities.TRANSPORT_WIFI)
                        || capabilities.hasTransport(NetworkCapabilities.TRANSPORT_ETHERNET);
        return isWifi ? WIFI : METERED;
    }

    @Override
    public void onCapabilitiesChanged(Network network, NetworkCapabilities capabilities) {
        onReachabilityChangedInternal(classify(capabilities));
    }

    @Override
    public void onLost(Network network) {
        onReachabilityChangedInternal(UNREACHABLE);
    }

    private static native void onReachabilityChangedInternal(int value);
}
