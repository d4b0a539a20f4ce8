package korvel.core;

import android.app.Application;
import android.content.Context;
import org.jspecify.annotations.Nullable;

/**
 * The Android application that the native libraries live in.
 *
 * <p>On Android nothing needs to be done: the process's application is found when it is asked for.
 * Code that has another context, for instance in a test, hands it over with {@link #install}.
 *
 * <p>Threads: any.
 */
public final class CoreApplication {
    private static final long LAST_EVENT_WAIT_MS = 2000;

    private static volatile @Nullable Context installed;
    private static volatile boolean isLoaded;

    private CoreApplication() {}

    /** The application's context, or null outside Android. */
    public static @Nullable Context getApplicationContext() {
        final Context context = installed;
        return context != null ? context : findApplication();
    }

    /**
     * Makes the native libraries use this context, and Android's microphone, network state,
     * proximity sensor and log through it. May be called before they are loaded, and repeatedly.
     *
     * @param context any context of the application; not null. One that does not know its
     *     application yet counts only until another is given
     */
    public static void install(Context context) {
        final Context application = context.getApplicationContext();
        if (application != null) {
            installed = application;
        } else if (installed == null) {
            installed = context;
        }
        connect();
    }

    /**
     * Connects the native library to Android as soon as it is loaded, where there is an
     * application. Not done while it is being loaded: its native methods are found afterwards only.
     */
    public static void connect() {
        if (isLoaded) {
            installBackends();
        }
    }

    private static @Nullable Context findApplication() {
        try {
            // Hidden, but in place since the first Android; there is no public way without a
            // context.
            final Class<?> thread = Class.forName("android.app.ActivityThread");
            return (Application) thread.getMethod("currentApplication").invoke(null);
        } catch (ReflectiveOperationException | LinkageError notAndroid) {
            return null;
        }
    }

    /** Called by the native library, once, while it is loaded. */
    static void onLibraryLoaded() {
        isLoaded = true;
        Runtime.getRuntime().addShutdownHook(new Thread(CoreApplication::end, "talvox-end"));
    }

    /** Ends the events; an application that never returns from one is not waited for long. */
    private static void end() {
        final Thread ending = new Thread(CoreApplication::endInternal, "talvox-last-event");
        ending.setDaemon(true);
        ending.start();
        try {
            ending.join(LAST_EVENT_WAIT_MS);
        } catch (InterruptedException interrupted) {
            Thread.currentThread().interrupt();
        }
    }

    private static native void installBackends();

    private static native void endInternal();
}
