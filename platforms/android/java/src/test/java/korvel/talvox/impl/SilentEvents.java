package korvel.talvox.impl;

/** Ignores every event; for tests that care about one of them or none. */
class SilentEvents implements Recognizer.Events {
    @Override
    public void onRecordingBegin() {}

    @Override
    public void onSpeakingBegin() {}

    @Override
    public void onRecordingDone() {}

    @Override
    public void onPowerChanged(float power) {}

    @Override
    public void onBufferReceived(byte[] buffer) {}

    @Override
    public void onErrorDetail(String reason, Integer httpStatus, Integer deviceError) {}

    @Override
    public void onError(int code) {}

    @Override
    public void onResults(
            int outcome, String[] texts, float[] confidences, String requestId) {}
}
