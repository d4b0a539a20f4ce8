package korvel.talvox;

import android.util.Log;
import java.util.concurrent.Executor;
import korvel.talvox.impl.EngineBackend;
import org.jspecify.annotations.Nullable;

/**
 * One recognition from start to close: takes the events of the engine and hands them to the
 * listener's executor. The monitor is never held while the engine or the listener runs.
 */
final class Session implements EngineBackend.Events {
    private static final String TAG = "Talvox";

    private final RecognitionListener listener;
    private final SerialExecutor executor;
    private @Nullable Object owner;
    private EngineBackend.@Nullable Running handle;
    private boolean stopWanted;
    private boolean cancelWanted;
    private volatile String errorReason = "";
    private volatile boolean ended;
    private volatile boolean closed;

    Session(RecognitionListener listener, Executor executor) {
        this.listener = listener;
        this.executor = new SerialExecutor(executor);
    }

    /**
     * Starts.
     *
     * @param owner kept alive until the last event has been delivered
     */
    void start(
            EngineBackend engine,
            TalvoxSettings settings,
            RecordingOptions recording,
            Object owner) {
        synchronized (this) {
            this.owner = owner;
        }
        final EngineBackend.Running started;
        try {
            started = engine.start(settings, recording, this);
        } catch (RuntimeException | OutOfMemoryError failure) {
            refuse(failure);
            return;
        }
        synchronized (this) {
            handle = started;
        }
        catchUp(started);
    }

    /** The engine has no memory for the recognition, and keeps nothing of it. */
    private void refuse(Throwable failure) {
        Log.e(TAG, "the recognition does not start", failure);
        final String reason = String.valueOf(failure.getMessage());
        onError(SpeechError.UNKNOWN, new ErrorDetail(reason, null, null, null));
    }

    /** Does what was asked for, from an event or another thread, before the start had returned. */
    private void catchUp(EngineBackend.Running started) {
        final boolean stop;
        final boolean cancel;
        synchronized (this) {
            stop = stopWanted;
            cancel = cancelWanted;
        }
        if (closed) {
            release(started);
        } else if (cancel) {
            cancel(started);
        } else if (stop) {
            stop(started);
        }
    }

    void stop() {
        final EngineBackend.@Nullable Running running;
        synchronized (this) {
            running = handle;
            stopWanted = true;
        }
        if (running != null) {
            stop(running);
        }
    }

    void cancel() {
        final EngineBackend.@Nullable Running running;
        synchronized (this) {
            running = handle;
            cancelWanted = true;
        }
        if (running != null) {
            cancel(running);
        }
    }

    void close() {
        final EngineBackend.@Nullable Running running;
        synchronized (this) {
            running = handle;
            closed = true;
            owner = null;
        }
        if (running != null) {
            release(running);
        }
    }

    private void stop(EngineBackend.Running running) {
        if (!ended) {
            running.stop();
        }
    }

    private void cancel(EngineBackend.Running running) {
        if (!ended) {
            running.cancel();
        }
    }

    private void release(EngineBackend.Running running) {
        cancel(running);
        running.close();
    }

    private synchronized void over() {
        owner = null;
    }

    private void deliver(Runnable event) {
        if (!ended) {
            executor.execute(unlessClosed(event));
        }
    }

    /** The event lock serialises the events, so one of them is the last. */
    private void deliverLast(Runnable event) {
        if (ended) {
            return;
        }
        ended = true;
        executor.execute(
                unlessClosed(
                        () -> {
                            over();
                            event.run();
                        }),
                this::over);
    }

    private Runnable unlessClosed(Runnable event) {
        return () -> {
            if (!closed) {
                event.run();
            }
        };
    }

    @Override
    public void onRecordingBegin() {
        deliver(listener::onRecordingBegin);
    }

    @Override
    public void onSpeakingBegin() {
        deliver(listener::onSpeakingBegin);
    }

    @Override
    public void onRecordingDone() {
        deliver(listener::onRecordingDone);
    }

    @Override
    public void onPowerChanged(float power) {
        deliver(() -> listener.onPowerChanged(power));
    }

    @Override
    public void onBufferReceived(byte[] buffer) {
        deliver(() -> listener.onBufferReceived(buffer));
    }

    String getErrorReason() {
        return errorReason;
    }

    @Override
    public void onError(SpeechError error, ErrorDetail detail) {
        if (!ended) {
            errorReason = detail.getReason();
        }
        deliverLast(() -> listener.onError(error, detail));
    }

    @Override
    public void onResults(Recognition recognition) {
        deliverLast(() -> listener.onResults(recognition));
    }
}
