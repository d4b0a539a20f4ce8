package korvel.talvox.support;

import java.io.BufferedReader;
import java.io.IOException;
import java.io.InputStreamReader;
import java.io.UncheckedIOException;
import java.nio.charset.StandardCharsets;

/** The real development gateway as a process of its own, on a free loopback port. */
public final class DevelopmentGateway implements AutoCloseable {
    private final Process process;
    private final String url;

    public DevelopmentGateway() {
        try {
            process =
                    new ProcessBuilder(System.getProperty("talvox.gateway"), "--port", "0")
                            .redirectError(ProcessBuilder.Redirect.DISCARD)
                            .start();
            final String line =
                    new BufferedReader(
                                    new InputStreamReader(
                                            process.getInputStream(), StandardCharsets.UTF_8))
                            .readLine();
            if (line == null) {
                throw new IOException("the gateway does not start");
            }
            url = line.substring(line.lastIndexOf(' ') + 1);
        } catch (IOException failure) {
            throw new UncheckedIOException(failure);
        }
    }

    public String getUrl() {
        return url;
    }

    @Override
    public void close() {
        process.destroy();
    }
}
