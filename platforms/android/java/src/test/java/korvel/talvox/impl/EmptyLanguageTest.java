package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.BlockingQueue;
import java.util.concurrent.LinkedBlockingQueue;
import java.util.concurrent.TimeUnit;
import korvel.talvox.AsrPolicy;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Microphone;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

/** A bundle with an empty language: one error, nothing sent, and the process lives. */
public class EmptyLanguageTest extends EngineTestCase {
    private static final int SPEED = 4;
    private static final int NETWORK = 3;

    private final BlockingQueue<Integer> errors = new LinkedBlockingQueue<>();
    private RecordingGateway gateway;
    private Microphone microphone;

    @Before
    public void plugIn() {
        Connectivity.wifi(application);
        gateway = new RecordingGateway(true);
        useGateway(gateway.getUrl());
        microphone = new Microphone(16000, SPEED).plugIn();
    }

    @After
    public void unplug() {
        microphone.close();
        gateway.close();
    }

    private void assertOneErrorAndNothingSent(boolean streaming, AsrPolicy policy)
            throws Exception {
        final Bundle update = new Bundle();
        update.putBoolean(TalvoxSettings.STREAMING.getName(), streaming);
        Talvox.updateSettings(Talvox.getHandle(), update);
        final Bundle settings =
                TalvoxSettings.forRecognition()
                        .set(TalvoxSettings.ASR_POLICY, policy)
                        .build()
                        .toBundle();
        settings.putString(TalvoxSettings.LANGUAGE.getName(), "");
        expectAssertions(1);
        final NativeHandle session =
                Recognizer.start(
                        Talvox.getHandle(),
                        settings,
                        new SilentEvents() {
                            @Override
                            public void onRecordingBegin() {
                                microphone.say(Microphone.recording("goforward.raw"));
                            }

                            @Override
                            public void onError(int code) {
                                errors.add(code);
                            }
                        });
        assertEquals(Integer.valueOf(NETWORK), errors.poll(PATIENCE_S, TimeUnit.SECONDS));
        Recognizer.stop(session);
        Recognizer.cancel(session);
        session.close();
        final List<Integer> others = new ArrayList<>(errors);
        assertTrue(others.toString(), others.isEmpty());
        assertLogged("Network: a request cannot be sent: the language is empty");
        assertTrue(gateway.isEmpty());
    }

    @Test
    public void inOnePiece() throws Exception {
        assertOneErrorAndNothingSent(false, AsrPolicy.KORVEL_ONLY);
    }

    @Test
    public void streamed() throws Exception {
        assertOneErrorAndNothingSent(true, AsrPolicy.KORVEL_ONLY);
    }

    @Test
    public void whereTheDeviceHasNoRecogniser() throws Exception {
        assertOneErrorAndNothingSent(false, AsrPolicy.PLATFORM_FIRST);
    }
}
