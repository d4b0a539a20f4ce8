package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import java.io.File;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.util.concurrent.atomic.AtomicReference;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.Microphone;
import korvel.talvox.support.PrivateAuthority;
import korvel.talvox.support.RecordingGateway;
import org.junit.After;
import org.junit.Before;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/** The authorities that https connections trust. */
public class CertificateFileTest extends EngineTestCase {
    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    private PrivateAuthority authority;

    @Before
    public void found() throws Exception {
        authority = new PrivateAuthority(folder.newFolder());
        Connectivity.wifi(application);
    }

    @After
    public void returnToTheSystem() {
        engine.setCertificateFile(null);
    }

    /**
     * Sends what a microphone hears until the recording has begun; without results in any case.
     *
     * @return what is known of the error
     */
    private ErrorDetail recognize() throws InterruptedException {
        final AtomicReference<ErrorDetail> detail = new AtomicReference<>();
        final Events events =
                new Events() {
                    @Override
                    public void onError(SpeechError error, ErrorDetail value) {
                        detail.set(value);
                        super.onError(error, value);
                    }
                };
        try (Microphone microphone = new Microphone(16000, 4).plugIn();
                TalvoxRecognizer recognizer =
                        engine.createRecognizer(
                                TalvoxSettings.forRecognition().build(), events)) {
            recognizer.start();
            assertEquals("recordingBegin", events.next());
            recognizer.stop();
            assertEquals("error NETWORK", events.end());
            return detail.get();
        }
    }

    @Test
    public void aPrivateAuthorityIsTrustedWhileItsFileIsSet() throws Exception {
        try (RecordingGateway gateway =
                new RecordingGateway(true, authority.getServerCertificate())) {
            useGateway(gateway.getUrl());
            final ErrorDetail refused = recognize();
            assertTrue(refused.toString(), refused.getReason().contains("certificate"));
            assertNull(refused.getHttpStatus());
            assertTrue("the request was sent all the same", gateway.isEmpty());
            engine.setCertificateFile(authority.getFile());
            assertEquals((Integer) 200, recognize().getHttpStatus());
            assertEquals("/asrgw", gateway.take().path);
            engine.setCertificateFile(new PrivateAuthority(folder.newFolder()).getFile());
            recognize();
            assertTrue("another authority is trusted", gateway.isEmpty());
            engine.setCertificateFile(authority.getFile());
            recognize();
            assertEquals("/asrgw", gateway.take().path);
            engine.setCertificateFile(null);
            recognize();
            assertTrue("the file is still used", gateway.isEmpty());
        }
    }

    private void assertRefused(File file, String reason) {
        assertEquals(
                "certificate file " + file + ": " + reason,
                assertThrows(
                                IllegalArgumentException.class,
                                () -> engine.setCertificateFile(file))
                        .getMessage());
    }

    private File write(String text) throws Exception {
        final File file = folder.newFile();
        Files.write(file.toPath(), text.getBytes(StandardCharsets.ISO_8859_1));
        return file;
    }

    @Test
    public void whatHoldsNoWholeCertificatesIsRefused() throws Exception {
        final String good =
                new String(
                        Files.readAllBytes(authority.getFile().toPath()),
                        StandardCharsets.ISO_8859_1);
        engine.setCertificateFile(write("a comment\n" + good + "another\n" + good));
        final File missing = new File(folder.getRoot(), "missing.pem");
        assertRefused(missing, "cannot be read: there is no such file");
        assertRefused(folder.getRoot(), "cannot be read: it is not a file");
        // The system refuses to read it, also to root.
        assertRefused(new File("/proc/self/mem"), "cannot be read: Input/output error");
        assertRefused(write(""), "holds no PEM certificate");
        assertRefused(write("CN=ca"), "holds no PEM certificate");
        assertRefused(
                write(good + good.substring(0, good.length() / 2)),
                "certificate 2 in it has no end");
        assertRefused(
                write(good + good + good.replaceFirst("MI", "AA")),
                "certificate 3 in it is broken");
    }

    @Test
    public void aRefusedFileLeavesTheOneBefore() throws Exception {
        try (RecordingGateway gateway =
                new RecordingGateway(true, authority.getServerCertificate())) {
            useGateway(gateway.getUrl());
            engine.setCertificateFile(authority.getFile());
            assertThrows(
                    IllegalArgumentException.class,
                    () -> engine.setCertificateFile(write("nothing")));
            recognize();
            assertEquals("/asrgw", gateway.take().path);
        }
    }
}
