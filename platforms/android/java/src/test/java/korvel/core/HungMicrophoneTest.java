package korvel.core;

import static org.junit.Assert.assertTrue;

import java.util.Arrays;
import java.util.concurrent.Semaphore;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

/** Nobody waits for a microphone whose driver never comes back. */
public class HungMicrophoneTest extends EngineTestCase {
    private static final TalvoxSettings NOTHING = TalvoxSettings.builder().build();
    private static final int SESSIONS = 9;
    private static final double NS_PER_MS = 1e6;

    // A busy machine delays a single call at will, so that the median keeps the promise; and no
    // call may take as long as the shortest wait for a time-out would.
    private static final double MEDIAN_MS_MAX = 50;
    private static final double SINGLE_MS_MAX = 1000;

    /** Hangs in its first read, until the test is over. */
    private final class Hanging implements SoundInput {
        @Override
        public int read(byte[] buffer, int sizeInBytes) {
            reading.release();
            endOfTest.acquireUninterruptibly();
            return 0;
        }

        @Override
        public void close() {}
    }

    private final Semaphore reading = new Semaphore(0);
    private final Semaphore endOfTest = new Semaphore(0);
    private final double[] tookMs = new double[SESSIONS];

    @Before
    public void plugIn() {
        Connectivity.wifi(application);
        useGateway("http://127.0.0.1:9/");
        AudioRecorderBackend.setInputFactory(
                (sampleRateHz, bufferLengthMs, mode) -> new Hanging());
    }

    @After
    public void unplug() {
        endOfTest.release(1 << 20);
        AudioRecorderBackend.setInputFactory(null);
    }

    private void measure(int session, Runnable call) {
        final long begin = System.nanoTime();
        call.run();
        tookMs[session] = (System.nanoTime() - begin) / NS_PER_MS;
    }

    private void checkTimes(String call) {
        Arrays.sort(tookMs);
        final double median = tookMs[SESSIONS / 2];
        final double longest = tookMs[SESSIONS - 1];
        System.out.printf(
                "| microphone hangs, Java | %s | %d | %.1f | %.1f |%n",
                call, SESSIONS, median, longest);
        assertTrue("median " + median, median <= MEDIAN_MS_MAX);
        assertTrue("longest " + longest, longest <= SINGLE_MS_MAX);
    }

    /** The first one hangs in the microphone; those after it begin while that still hangs. */
    private TalvoxRecognizer startSession(int session) {
        final TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, new Events());
        recognizer.start();
        if (session == 0) {
            reading.acquireUninterruptibly();
        }
        return recognizer;
    }

    @Test
    public void delaysNoClose() {
        for (int session = 0; session < SESSIONS; session++) {
            final TalvoxRecognizer recognizer = startSession(session);
            measure(session, recognizer::close);
        }
        checkTimes("close");
    }

    @Test
    public void delaysNoCancel() {
        for (int session = 0; session < SESSIONS; session++) {
            try (TalvoxRecognizer recognizer = startSession(session)) {
                measure(session, recognizer::cancel);
            }
        }
        checkTimes("cancel");
    }

    @Test
    public void delaysNoStartOfTheNextSession() {
        for (int session = 0; session < SESSIONS; session++) {
            final TalvoxRecognizer recognizer =
                    engine.createRecognizer(NOTHING, new Events());
            measure(session, recognizer::start);
            if (session == 0) {
                reading.acquireUninterruptibly();
            }
            recognizer.close();
        }
        checkTimes("start of the next session");
    }
}
