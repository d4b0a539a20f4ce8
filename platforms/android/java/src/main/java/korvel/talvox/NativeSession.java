package korvel.talvox;

import korvel.core.RecordingReport;
import korvel.talvox.impl.DeviceFailure;
import korvel.talvox.impl.EngineBackend;
import korvel.talvox.impl.NativeHandle;
import korvel.talvox.impl.Recognizer;
import org.jspecify.annotations.Nullable;

/**
 * A session of the native engine: turns the numbers of its events into values, and puts together what
 * is known of an error. Native code calls it under the event lock.
 */
final class NativeSession implements Recognizer.Events {
    private final EngineBackend.Events events;
    private final RecordingReport recording = new RecordingReport();
    private String errorReason = "";

    private NativeSession(EngineBackend.Events events) {
        this.events = events;
    }

    static EngineBackend.Running start(
            long engine, TalvoxSettings settings, EngineBackend.Events events) {
        final NativeSession session = new NativeSession(events);
        return new Started(
                session.recording.during(
                        () -> Recognizer.start(engine, settings.toBundle(), session)));
    }

    private static final class Started implements EngineBackend.Running {
        private final NativeHandle handle;

        Started(NativeHandle handle) {
            this.handle = handle;
        }

        @Override
        public void stop() {
            Recognizer.stop(handle);
        }

        @Override
        public void cancel() {
            Recognizer.cancel(handle);
        }

        @Override
        public void close() {
            handle.close();
        }
    }

    @Override
    public void onRecordingBegin() {
        events.onRecordingBegin();
    }

    @Override
    public void onSpeakingBegin() {
        events.onSpeakingBegin();
    }

    @Override
    public void onRecordingDone() {
        events.onRecordingDone();
    }

    @Override
    public void onPowerChanged(float power) {
        events.onPowerChanged(power);
    }

    @Override
    public void onBufferReceived(byte[] buffer) {
        events.onBufferReceived(buffer);
    }

    @Override
    public void onErrorReason(String reason) {
        errorReason = reason;
    }

    @Override
    public void onError(int code) {
        final DeviceFailure device = DeviceFailure.take();
        final SpeechError error = SpeechError.fromCode(code);
        events.onError(error, describe(error, device));
    }

    private ErrorDetail describe(SpeechError error, @Nullable DeviceFailure device) {
        return new ErrorDetail(
                findReason(error, device),
                error == SpeechError.NETWORK ? ErrorDetail.findHttpStatus(errorReason) : null,
                device == null ? null : device.getNumber(),
                RecorderState.of(recording.getState()));
    }

    /** Native code knows that the recorder or the device recognizer has failed, but not why. */
    private String findReason(SpeechError error, @Nullable DeviceFailure device) {
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
        events.onResults(Recognition.fromNative(outcome, texts, confidences, requestId));
    }
}
