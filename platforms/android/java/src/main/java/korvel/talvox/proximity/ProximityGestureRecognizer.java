package korvel.talvox.proximity;

import android.os.Handler;
import android.os.Looper;
import java.util.Objects;
import java.util.concurrent.Executor;
import korvel.talvox.impl.NativeHandle;
import korvel.talvox.impl.NativeLibrary;
import korvel.talvox.impl.SafetyNet;

/**
 * Recognises gestures in front of the proximity sensor, such as a hand that waves twice.
 *
 * <p>Any thread may call any method. Gestures are reported until {@link #close}, also after it when
 * it is called on another thread than the executor's and one is being delivered.
 */
public final class ProximityGestureRecognizer implements AutoCloseable {
    /** Receives gestures, on the executor given to the constructor. */
    public interface Listener {
        /**
         * A gesture has been recognised.
         *
         * @param gesture the name given to {@link #addGesture}
         */
        void onGesture(String gesture);
    }

    static {
        NativeLibrary.load();
    }

    private final NativeHandle handle;
    private final SafetyNet.Watch watch;
    private final Events events;

    /** Gestures are reported on the main looper. */
    public ProximityGestureRecognizer(Listener listener) {
        this(listener, new Handler(Looper.getMainLooper())::post);
    }

    /** Gestures are reported on the executor, one after the other. */
    public ProximityGestureRecognizer(Listener listener, Executor executor) {
        events =
                new Events(
                        Objects.requireNonNull(listener, "listener"),
                        Objects.requireNonNull(executor, "executor"));
        handle =
                new NativeHandle(create(events), ProximityGestureRecognizer::releaseRecognizer);
        watch = SafetyNet.watch(this, "a ProximityGestureRecognizer", handle::close);
    }

    /**
     * Adds a gesture to those that are looked for.
     *
     * @param name what the listener is told
     * @param pattern spans of time during which something is near or far, oldest first: each {@code
     *     near:} or {@code far:} with its least and its greatest length in milliseconds, as in
     *     {@code "near:50-500 far:50-500 near:50-500"} for a hand that waves twice. Without the
     *     greatest it may last for ever: {@code "near:1000-"}
     * @throws IllegalArgumentException if the pattern is not understood
     * @throws IllegalStateException if this is closed
     */
    public void addGesture(String name, String pattern) {
        Objects.requireNonNull(name, "name");
        Objects.requireNonNull(pattern, "pattern");
        use("addGesture", recognizer -> addGesture(recognizer, name, pattern));
    }

    /**
     * Begins to watch the sensor.
     *
     * @throws IllegalStateException if this is closed
     */
    public void start() {
        use("start", ProximityGestureRecognizer::start);
    }

    /**
     * Stops watching the sensor; the gestures stay.
     *
     * @throws IllegalStateException if this is closed
     */
    public void stop() {
        use("stop", ProximityGestureRecognizer::stop);
    }

    /** Stops and releases what this holds. Closing again does nothing. */
    @Override
    public void close() {
        watch.end();
        events.closed = true;
        handle.close();
    }

    private void use(String operation, NativeHandle.Operation action) {
        if (!handle.use(action)) {
            throw new IllegalStateException(operation + ": the gesture recognizer is closed");
        }
    }

    /** What native code keeps and calls, under the event lock. */
    private static final class Events {
        private final Listener listener;
        private final Executor executor;
        private volatile boolean closed;

        Events(Listener listener, Executor executor) {
            this.listener = listener;
            this.executor = executor;
        }

        /** Called by native code. */
        void onProximityGestureRecognized(String gesture) {
            executor.execute(
                    () -> {
                        if (!closed) {
                            listener.onGesture(gesture);
                        }
                    });
        }
    }

    private static native long create(Object listener);

    private static native void start(long recognizer);

    private static native void stop(long recognizer);

    private static native void addGesture(long recognizer, String name, String pattern);

    private static native void releaseRecognizer(long recognizer);
}
