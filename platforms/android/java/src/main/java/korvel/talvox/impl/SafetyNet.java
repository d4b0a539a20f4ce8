package korvel.talvox.impl;

import android.util.Log;
import java.lang.ref.PhantomReference;
import java.lang.ref.ReferenceQueue;
import java.util.Collections;
import java.util.Set;
import java.util.concurrent.ConcurrentHashMap;

/** Logs what the application forgot to close, and closes it. */
public final class SafetyNet {
    private static final String TAG = "Talvox";
    private static final ReferenceQueue<Object> DROPPED = new ReferenceQueue<>();
    private static final Set<Watch> WATCHES =
            Collections.newSetFromMap(new ConcurrentHashMap<Watch, Boolean>());

    static {
        final Thread thread = new Thread(SafetyNet::closeDropped, "talvox-safety-net");
        thread.setDaemon(true);
        thread.start();
    }

    private SafetyNet() {}

    /** One object under watch. */
    public static final class Watch extends PhantomReference<Object> {
        private final String name;
        private final Runnable close;

        private Watch(Object owner, String name, Runnable close) {
            super(owner, DROPPED);
            this.name = name;
            this.close = close;
        }

        /** To be called when the owner is closed as it should be. */
        public void end() {
            WATCHES.remove(this);
        }
    }

    /**
     * @param owner what should be closed before it is dropped
     * @param name what the log calls it
     * @param close closes it; must not refer to the owner; called on a thread of this class
     */
    public static Watch watch(Object owner, String name, Runnable close) {
        final Watch watch = new Watch(owner, name, close);
        WATCHES.add(watch);
        return watch;
    }

    private static void closeDropped() {
        while (true) {
            try {
                final Watch watch = (Watch) DROPPED.remove();
                if (WATCHES.remove(watch)) {
                    Log.w(TAG, watch.name + " was dropped without close(); it is closed now");
                    watch.close.run();
                }
            } catch (InterruptedException ignored) {
                // Nothing asks this thread to end.
            } catch (RuntimeException failure) {
                Log.e(TAG, "closing what was dropped failed", failure);
            }
        }
    }
}
