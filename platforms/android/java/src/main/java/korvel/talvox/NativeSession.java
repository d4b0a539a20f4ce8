package korvel.talvox;

import korvel.core.SessionRecording;
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
    private final SessionRecording recording;
    private String errorReason = "";
    private @Nullable Integer httpStatus;
    private @Nullable Integer deviceError;

    private NativeSession(RecordingOptions options, EngineBackend.Events events) {
        this.recording = new SessionRecording(options.getInputs());
        this.events = events;
    }

    static EngineBackend.Running start(
            long engine,
            TalvoxSettings settings,
            RecordingOptions options,
            EngineBackend.Events events) {
        final NativeSession session = new NativeSession(options, events);
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
    public void onErrorDetail(
            String reason, @Nullable Integer status, @Nullable Integer deviceNumber) {
        errorReason = reason;
        httpStatus = status;
        deviceError = deviceNumber;
    }

    @Override
    public void onError(int code) {
        final SpeechError error = SpeechError.fromCode(code);
        events.onError(
                error,
                new ErrorDetail(
                        findReason(error),
                        httpStatus,
                        deviceError,
                        RecorderState.of(recording.getState())));
    }

    /** Native code knows that the recorder has failed, or that no speech came, but not why. */
    private String findReason(SpeechError error) {
        final String cause =
                error == SpeechError.AUDIO
                        ? recording.getFailure()
                        : error == SpeechError.NO_VOICE ? findSilence() : "";
        return cause.isEmpty() ? errorReason : errorReason + ": " + cause;
    }

    private String findSilence() {
        final SessionRecording.State state = recording.getState();
        if (state == SessionRecording.State.SILENCED) {
            return "the system silences the microphone";
        }
        return state == SessionRecording.State.ONLY_ZEROS
                ? "the microphone delivers only zeros"
                : "";
    }

    @Override
    public void onResults(
            int outcome, String[] texts, float[] confidences, String requestId) {
        events.onResults(Recognition.fromNative(outcome, texts, confidences, requestId));
    }
}
