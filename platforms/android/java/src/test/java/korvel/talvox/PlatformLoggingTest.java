package korvel.talvox;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import java.io.File;
import java.io.IOException;
import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.nio.file.Files;
import java.util.Arrays;
import java.util.concurrent.TimeUnit;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.DeviceRecognizer;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.Before;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/** What of a recognition by the device is copied to the gateway. */
public class PlatformLoggingTest extends EngineTestCase {
    private static final int CHUNKS = 10;
    private static final int CHUNK_BYTES = 1600;

    private enum Sound {
        NONE,
        PCM,
        SPEEX
    }

    @Rule public final TemporaryFolder folder = new TemporaryFolder();
    private RecordingGateway gateway;

    @Before
    public void open() {
        DeviceRecognizer.install(application);
        gateway = new RecordingGateway(true);
        useGateway(gateway.getUrl());
    }

    @After
    public void close() {
        gateway.close();
        Connectivity.wifi(application);
    }

    /** A second of a tone at 8 kHz, 16-bit. */
    private static byte[] tone() {
        final ByteBuffer samples =
                ByteBuffer.allocate(CHUNKS * CHUNK_BYTES).order(ByteOrder.LITTLE_ENDIAN);
        for (int i = 0; i < samples.capacity() / 2; i++) {
            samples.putShort((short) (8000 * Math.sin(2 * Math.PI * 500 * i / 8000)));
        }
        return samples.array();
    }

    private Events recognize(LoggingPolicy logging, SoundFormat format) throws Exception {
        final Events events = new Events();
        engine.updateSettings(
                TalvoxSettings.builder().set(TalvoxSettings.SOUND_FORMAT, format).build());
        final TalvoxSettings settings =
                TalvoxSettings.forRecognition()
                        .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_ONLY)
                        .set(TalvoxSettings.LOGGING, logging)
                        .build();
        final byte[] sound = tone();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(settings, events)) {
            recognizer.start();
            for (int i = 0; i < CHUNKS; i++) {
                final byte[] chunk =
                        Arrays.copyOfRange(sound, i * CHUNK_BYTES, (i + 1) * CHUNK_BYTES);
                DeviceRecognizer.callBack(device -> device.onBufferReceived(chunk));
            }
            DeviceRecognizer.callBack(device -> device.onEndOfSpeech());
            DeviceRecognizer.callBack(
                    device ->
                            device.onResults(
                                    DeviceRecognizer.results(
                                            new float[] {0.85f, 0.25f}, "да", "no")));
            assertEquals("results", events.end());
        }
        return events;
    }

    private static Sound expectedSound(LoggingPolicy logging, SoundFormat format, boolean wifi) {
        final boolean withSound =
                logging == LoggingPolicy.WITH_SOUND_ALWAYS
                        || logging == LoggingPolicy.WITH_SOUND_IF_WIFI && wifi;
        if (!withSound) {
            return Sound.NONE;
        }
        final boolean speex =
                format == SoundFormat.SPEEX || format == SoundFormat.PCM_IF_WIFI && !wifi;
        return speex ? Sound.SPEEX : Sound.PCM;
    }

    @Test
    public void everyPolicyOnEveryNetworkInEveryFormat() throws Exception {
        for (boolean wifi : new boolean[] {true, false}) {
            if (wifi) {
                Connectivity.wifi(application);
            } else {
                Connectivity.mobile(application);
            }
            for (LoggingPolicy logging : LoggingPolicy.values()) {
                for (SoundFormat format : SoundFormat.values()) {
                    final Events events = recognize(logging, format);
                    assertEquals("да", events.getRecognition().getHypotheses().get(0).getText());
                    assertEquals("", events.getRecognition().getRequestId());
                    if (logging != LoggingPolicy.DISABLED) {
                        check(gateway.take(), expectedSound(logging, format, wifi));
                    }
                }
            }
        }
        assertTrue(gateway.isEmpty());
    }

    private void check(RecordingGateway.Request request, Sound sound) throws Exception {
        assertEquals("/asrgw", request.path);
        assertEquals("uuid=" + UUID, request.query);
        assertEquals(UUID, request.text("uuid"));
        assertEquals("en-US", request.text("lang"));
        assertEquals(
                "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n"
                        + "<Transcripts source=\"" + DeviceRecognizer.PACKAGE
                        + "\" default_language=\"en-US\" topic=\"free_form\">\n"
                        + "  <Transcript confidence=\"0.85\">да</Transcript>\n"
                        + "  <Transcript confidence=\"0.25\">no</Transcript>\n"
                        + "</Transcripts>\n",
                request.text("transcripts"));
        switch (sound) {
            case NONE:
                assertFalse(request.parts.containsKey("audio"));
                break;
            case PCM:
                assertArrayEquals(tone(), request.parts.get("audio"));
                break;
            case SPEEX:
                checkSpeex(request.parts.get("audio"));
                break;
        }
    }

    /** Decodes with a decoder of its own: all samples are there, and it is the tone. */
    private void checkSpeex(byte[] encoded) throws IOException, InterruptedException {
        final File input = folder.newFile();
        final File output = folder.newFile();
        Files.write(input.toPath(), encoded);
        final Process decoder =
                new ProcessBuilder(
                                "speexdec", "--no-enh", input.getPath(), output.getPath() + ".raw")
                        .redirectErrorStream(true)
                        .redirectOutput(ProcessBuilder.Redirect.DISCARD)
                        .start();
        assertTrue(decoder.waitFor(30, TimeUnit.SECONDS));
        assertEquals(0, decoder.exitValue());
        final byte[] decoded = Files.readAllBytes(new File(output.getPath() + ".raw").toPath());
        assertEquals(CHUNKS * CHUNK_BYTES, decoded.length);
        assertTrue("not the tone", correlation(tone(), decoded) > 0.9);
    }

    private static double correlation(byte[] one, byte[] other) {
        final ByteBuffer a = ByteBuffer.wrap(one).order(ByteOrder.LITTLE_ENDIAN);
        final ByteBuffer b = ByteBuffer.wrap(other).order(ByteOrder.LITTLE_ENDIAN);
        double ab = 0;
        double aa = 0;
        double bb = 0;
        while (a.remaining() >= 2) {
            final double x = a.getShort();
            final double y = b.getShort();
            ab += x * y;
            aa += x * x;
            bb += y * y;
        }
        return ab / Math.sqrt(aa * bb);
    }

    @Test
    public void emptyResultsAreLoggedToo() throws Exception {
        final Events events = new Events();
        final TalvoxSettings settings =
                TalvoxSettings.builder()
                        .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_ONLY)
                        .set(TalvoxSettings.LOGGING, LoggingPolicy.WITHOUT_SOUND_ALWAYS)
                        .build();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(settings, events)) {
            recognizer.start();
            DeviceRecognizer.callBack(device -> device.onError(7));
            assertEquals("results", events.end());
        }
        final RecordingGateway.Request request = gateway.take();
        assertFalse(request.text("transcripts").contains("<Transcript "));
        assertFalse(request.parts.containsKey("audio"));
    }

    @Test
    public void errorsAreNotLogged() throws Exception {
        final Events events = new Events();
        final TalvoxSettings settings =
                TalvoxSettings.builder()
                        .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_ONLY)
                        .set(TalvoxSettings.LOGGING, LoggingPolicy.WITH_SOUND_ALWAYS)
                        .build();
        try (TalvoxRecognizer recognizer = engine.createRecognizer(settings, events)) {
            recognizer.start();
            DeviceRecognizer.callBack(device -> device.onError(2));
            assertEquals("error NETWORK", events.end());
        }
        recognize(LoggingPolicy.WITHOUT_SOUND_ALWAYS, SoundFormat.PCM);
        assertTrue(gateway.take().text("transcripts").contains("да"));
        assertTrue(gateway.isEmpty());
    }
}
