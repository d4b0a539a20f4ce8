package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.util.concurrent.atomic.AtomicReference;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.Microphone;
import korvel.talvox.support.RecordingGateway;
import org.junit.Before;
import org.junit.Test;

/** What an application can find out about the cause of an error. */
public class ErrorReasonTest extends EngineTestCase {
    private static final TalvoxSettings NOTHING = TalvoxSettings.forRecognition().build();

    /** Keeps the reason that there is when the error arrives. */
    private static final class Asking extends Events {
        final AtomicReference<TalvoxRecognizer> recognizer = new AtomicReference<>();
        volatile String reason;

        @Override
        public void onError(SpeechError error) {
            reason = recognizer.get().getErrorReason();
            super.onError(error);
        }
    }

    @Before
    public void join() {
        Connectivity.wifi(application);
    }

    /** Records until the recording has begun, and expects the error and its reason. */
    private void expectAnswer(String reason) throws InterruptedException {
        final Asking events = new Asking();
        try (Microphone microphone = new Microphone(16000, 4).plugIn();
                TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING, events)) {
            events.recognizer.set(recognizer);
            assertEquals("", recognizer.getErrorReason());
            recognizer.start();
            assertEquals("recordingBegin", events.next());
            assertEquals("", recognizer.getErrorReason());
            recognizer.stop();
            assertEquals("error NETWORK", events.end());
            recognizer.close();
            assertEquals(reason, events.reason);
            assertEquals(reason, recognizer.getErrorReason());
        }
    }

    @Test
    public void theStatusOfTheAnswer() throws Exception {
        try (RecordingGateway gateway = new RecordingGateway(true)) {
            useGateway(gateway.getUrl());
            gateway.setStatus(404);
            expectAnswer("HTTP status 404");
            gateway.setStatus(503);
            expectAnswer("HTTP status 503 (the service is busy)");
        }
    }

    @Test
    public void whatEndsARecognitionInsideItsStart() throws Exception {
        forgetGateway();
        for (boolean direct : new boolean[] {false, true}) {
            final Asking events = new Asking();
            try (TalvoxRecognizer recognizer =
                    direct
                            ? engine.createRecognizer(NOTHING, events, Runnable::run)
                            : engine.createRecognizer(NOTHING, events)) {
                events.recognizer.set(recognizer);
                recognizer.start();
                assertEquals("error NETWORK", events.end());
            }
            assertTrue(events.reason, events.reason.contains("url"));
        }
    }
}
