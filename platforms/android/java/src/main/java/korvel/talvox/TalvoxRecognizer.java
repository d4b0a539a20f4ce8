package korvel.talvox;

import java.util.concurrent.Executor;
import korvel.talvox.impl.EngineBackend;
import korvel.talvox.impl.SafetyNet;
import org.jspecify.annotations.Nullable;

/**
 * One recognition: created by {@link TalvoxEngine#createRecognizer}, started once, closed when it is
 * no longer needed.
 *
 * <p>Any thread may call any method, also from inside an event; none waits for the network, the
 * microphone or the listener. One recognition may run at a time: a second one that is started hears
 * {@link SpeechError#BUSY}. The next may be started from inside {@link
 * RecognitionListener#onResults} or {@link RecognitionListener#onError}.
 */
public final class TalvoxRecognizer implements AutoCloseable {
    private enum State {
        NEW,
        STARTED,
        CLOSED
    }

    private final EngineBackend engine;
    private final TalvoxSettings settings;
    private final RecordingOptions recording;
    private final Session session;
    private SafetyNet.@Nullable Watch watch;
    private State state = State.NEW;

    TalvoxRecognizer(
            EngineBackend engine,
            TalvoxSettings settings,
            RecordingOptions recording,
            RecognitionListener listener,
            Executor executor) {
        this.engine = engine;
        this.settings = settings;
        this.recording = recording;
        this.session = new Session(listener, executor);
    }

    /**
     * Starts to listen. Whatever goes wrong is reported by {@link RecognitionListener#onError}. The
     * recognition goes on until its last event, also when nothing refers to this object any more.
     *
     * @throws IllegalStateException if it has been started before or is closed
     */
    public void start() {
        synchronized (this) {
            if (state != State.NEW) {
                throw new IllegalStateException(
                        state == State.CLOSED
                                ? "start: the recognizer is closed"
                                : "start: a recognizer can be started once; create another one");
            }
            state = State.STARTED;
            watch = SafetyNet.watch(this, "a TalvoxRecognizer", session::close);
        }
        session.start(engine, settings, recording, this);
    }

    /**
     * Ends listening; the answer to what was said so far follows. Nothing happens when listening is
     * over already.
     *
     * @throws IllegalStateException if it has not been started or is closed
     */
    public void stop() {
        checkStarted("stop");
        session.stop();
    }

    /**
     * Gives up; {@link RecognitionListener#onError} with {@link SpeechError#CANCELED} follows.
     * Nothing happens when the recognition is over already.
     *
     * @throws IllegalStateException if it has not been started or is closed
     */
    public void cancel() {
        checkStarted("cancel");
        session.cancel();
    }

    /**
     * Why the recognition ended with its error, for developers and logs: one line of English, from
     * the network layer where that failed, such as "HTTP status 404" or "HTTP status 503 (the service
     * is busy)". The texts are not fixed: do not let code depend on them, nor show them to users.
     *
     * @return empty while there is no error, after results, and where the cause is not known; there
     *     from inside {@link RecognitionListener#onError} on, also after {@link #close}
     */
    public String getErrorReason() {
        return session.getErrorReason();
    }

    /**
     * Gives up without an event if the recognition is running, and releases what it holds. No event
     * is delivered after this when it is called on the listener's executor; on another thread, one
     * that is being delivered may still come to its end. Closing again does nothing.
     */
    @Override
    public void close() {
        synchronized (this) {
            if (state == State.CLOSED) {
                return;
            }
            state = State.CLOSED;
            if (watch != null) {
                watch.end();
            }
        }
        session.close();
    }

    private synchronized void checkStarted(String operation) {
        if (state != State.STARTED) {
            throw new IllegalStateException(
                    operation
                            + ": the recognizer "
                            + (state == State.CLOSED ? "is closed" : "has not been started"));
        }
    }
}
