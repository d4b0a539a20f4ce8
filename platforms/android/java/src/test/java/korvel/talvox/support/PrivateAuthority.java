package korvel.talvox.support;

import static org.junit.Assert.assertEquals;

import java.io.File;
import java.io.FileInputStream;
import java.io.InputStream;
import java.security.KeyStore;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import javax.net.ssl.KeyManagerFactory;
import javax.net.ssl.SSLContext;

/** A certificate authority that no system knows, with a server certificate for 127.0.0.1. */
public final class PrivateAuthority {
    private static final String PASSWORD = "talvox-test";

    private final File folder;
    private final File store;

    /**
     * @param folder an empty one
     */
    public PrivateAuthority(File folder) throws Exception {
        this.folder = folder;
        store = new File(folder, "keys.p12");
        final String request = path("server.csr");
        final String certificate = path("server.crt");
        keytool("-genkeypair", "-alias", "ca", "-keyalg", "EC", "-dname", "CN=ca", "-ext", "bc:c");
        keytool("-genkeypair", "-alias", "server", "-keyalg", "EC", "-dname", "CN=server");
        keytool("-certreq", "-alias", "server", "-file", request);
        keytool(
                "-gencert", "-alias", "ca", "-ext", "san=ip:127.0.0.1", "-rfc", "-infile", request,
                "-outfile", certificate);
        keytool("-importcert", "-alias", "server", "-noprompt", "-file", certificate);
        keytool("-exportcert", "-rfc", "-alias", "ca", "-file", getFile().getPath());
    }

    private String path(String name) {
        return new File(folder, name).getPath();
    }

    /** The authority's certificate in PEM form. */
    public File getFile() {
        return new File(folder, "ca.pem");
    }

    /** What a server at 127.0.0.1 identifies itself with. */
    public SSLContext getServerCertificate() throws Exception {
        final KeyStore keys = KeyStore.getInstance("PKCS12");
        try (InputStream input = new FileInputStream(store)) {
            keys.load(input, PASSWORD.toCharArray());
        }
        keys.deleteEntry("ca");
        final KeyManagerFactory factory =
                KeyManagerFactory.getInstance(KeyManagerFactory.getDefaultAlgorithm());
        factory.init(keys, PASSWORD.toCharArray());
        // Android's provider, which the tests run with; the JVM's own does not work beside it.
        final SSLContext context = SSLContext.getInstance("TLS", "Conscrypt");
        context.init(factory.getKeyManagers(), null, null);
        return context;
    }

    private void keytool(String... arguments) throws Exception {
        final List<String> command =
                new ArrayList<>(
                        Arrays.asList(
                                new File(System.getProperty("java.home"), "bin/keytool").getPath()));
        command.addAll(Arrays.asList(arguments));
        command.addAll(Arrays.asList("-keystore", store.getPath(), "-storepass", PASSWORD));
        final Process process =
                new ProcessBuilder(command)
                        .redirectErrorStream(true)
                        .redirectOutput(new File(folder, "keytool.log"))
                        .start();
        assertEquals(command.toString(), 0, process.waitFor());
    }
}
