package korvel.talvox;

import android.util.Log;
import java.util.concurrent.Executor;
import korvel.core.RecordingReport;
import korvel.talvox.impl.DeviceFailure;
import korvel.talvox.impl.NativeHandle;
import korvel.talvox.impl.Recognizer;

/**
 * One recognition from start to close: takes the events from native code and hands them to the
 * listener's executor. The monitor is never held while native code or the listener runs.
 */
final class Session implements Recognizer.Events {
    private static final String TAG = "Talvox";

    private final RecognitionListener listener;
    private final SerialExecutor executor;
    private final RecordingReport recording = new RecordingReport();
    private Object owner;
    private NativeHandle handle;
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
    void start(TalvoxEngine engine, TalvoxSettings settings, Object owner) {
        synchronized (this) {
            this.owner = owner;
        }
        final NativeHandle started;
        try {
            started =
                    recording.during(
                            () ->
                                    Recognizer.start(
                                            engine.getHandle(), settings.toBundle(), this));
        } catch (RuntimeException | OutOfMemoryError failure) {
            refuse(failure);
            return;
        }
        synchronized (this) {
            handle = started;
        }
        catchUp(started);
    }

    /** Native code has no memory for the recognition, and keeps nothing of it. */
    private void refuse(Throwable failure) {
        Log.e(TAG, "the recognition does not start", failure);
        onErrorReason(String.valueOf(failure.getMessage()));
        onError(SpeechError.UNKNOWN.getCode());
    }

    /** Does what was asked for, from an event or another thread, before the start had returned. */
    private void catchUp(NativeHandle started) {
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
        final NativeHandle running;
        synchronized (this) {
            running = handle;
            stopWanted = true;
        }
        if (running != null) {
            stop(running);
        }
    }

    void cancel() {
        final NativeHandle running;
        synchronized (this) {
            running = handle;
            cancelWanted = true;
        }
        if (running != null) {
            cancel(running);
        }
    }

    void close() {
        final NativeHandle running;
        synchronized (this) {
            running = handle;
            closed = true;
            owner = null;
        }
        if (running != null) {
            release(running);
        }
    }

    private void stop(NativeHandle running) {
        if (!ended) {
            Recognizer.stop(running);
        }
    }

    private void cancel(NativeHandle running) {
        if (!ended) {
            Recognizer.cancel(running);
        }
    }

    private void release(NativeHandle running) {
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

    @Override
    public void onErrorReason(String reason) {
        if (!ended) {
            errorReason = reason;
        }
    }

    String getErrorReason() {
        return errorReason;
    }

    @Override
    public void onError(int code) {
        final DeviceFailure device = DeviceFailure.take();
        if (ended) {
            return;
        }
        final SpeechError error = SpeechError.fromCode(code);
        final ErrorDetail detail = describe(error, device);
        errorReason = detail.getReason();
        deliverLast(() -> listener.onError(error, detail));
    }

    private ErrorDetail describe(SpeechError error, DeviceFailure device) {
        return new ErrorDetail(
                findReason(error, device),
                error == SpeechError.NETWORK ? ErrorDetail.findHttpStatus(errorReason) : null,
                device == null ? null : device.getNumber(),
                RecorderState.of(recording.getState()));
    }

    /** Native code knows that the recorder or the device recognizer has failed, but not why. */
    private String findReason(SpeechError error, DeviceFailure device) {
        if (device != null && errorReason.isEmpty()) {
            return device.getReason();
        }
        final String failure = recording.getFailure();
        return error == SpeechError.AUDIO && !failure.isEmpty()
                ? errorReason + ": " + failure
                : errorReason;
    }

    @Override
    public void onResults(
            int outcome, String[] texts, float[] confidences, String requestId) {
        DeviceFailure.take();
        final Recognition recognition =
                Recognition.fromNative(outcome, texts, confidences, requestId);
        deliverLast(() -> listener.onResults(recognition));
    }
}
