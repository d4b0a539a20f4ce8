package korvel.talvox.support;

import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertTrue;

import com.sun.net.httpserver.HttpExchange;
import com.sun.net.httpserver.HttpServer;
import com.sun.net.httpserver.HttpsConfigurator;
import com.sun.net.httpserver.HttpsServer;
import java.io.ByteArrayOutputStream;
import java.io.IOException;
import java.io.UncheckedIOException;
import java.net.InetAddress;
import java.net.InetSocketAddress;
import java.nio.charset.StandardCharsets;
import java.util.LinkedHashMap;
import java.util.Map;
import java.util.concurrent.BlockingQueue;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.LinkedBlockingQueue;
import java.util.concurrent.TimeUnit;
import javax.net.ssl.SSLContext;

/** A gateway that keeps each request and answers with nothing recognised, or when it is told to. */
public final class RecordingGateway implements AutoCloseable {
    /** One request. */
    public static final class Request {
        public final String path;
        public final String query;
        public final Map<String, byte[]> parts;

        Request(String path, String query, Map<String, byte[]> parts) {
            this.path = path;
            this.query = query;
            this.parts = parts;
        }

        public String text(String part) {
            final byte[] bytes = parts.get(part);
            assertNotNull("no part " + part + " in " + parts.keySet(), bytes);
            return new String(bytes, StandardCharsets.UTF_8);
        }
    }

    private final HttpServer server;
    private final ExecutorService threads = Executors.newCachedThreadPool();
    private final BlockingQueue<Request> requests = new LinkedBlockingQueue<>();
    private final boolean answers;
    private volatile int status = 200;

    /**
     * @param answers false to let every client wait for its answer until {@link #close}
     */
    public RecordingGateway(boolean answers) {
        this(answers, null);
    }

    /**
     * @param answers false to let every client wait for its answer until {@link #close}
     * @param certificate what the gateway identifies itself with; null for no TLS
     */
    public RecordingGateway(boolean answers, SSLContext certificate) {
        this.answers = answers;
        try {
            server = create(certificate);
        } catch (IOException failure) {
            throw new UncheckedIOException(failure);
        }
        server.createContext("/", this::handle);
        server.setExecutor(threads);
        server.start();
    }

    private static HttpServer create(SSLContext certificate) throws IOException {
        final InetSocketAddress address =
                new InetSocketAddress(InetAddress.getLoopbackAddress(), 0);
        if (certificate == null) {
            return HttpServer.create(address, 0);
        }
        final HttpsServer server = HttpsServer.create(address, 0);
        server.setHttpsConfigurator(new HttpsConfigurator(certificate));
        return server;
    }

    public String getUrl() {
        return (server instanceof HttpsServer ? "https" : "http")
                + "://127.0.0.1:"
                + server.getAddress().getPort();
    }

    /** The status of the answers from now on; a 503 asks to try again. */
    public void setStatus(int value) {
        status = value;
    }

    /** Waits for the next request. */
    public Request take() throws InterruptedException {
        final Request request = requests.poll(KitTest.PATIENCE_S, TimeUnit.SECONDS);
        assertNotNull("no request came", request);
        return request;
    }

    public boolean isEmpty() {
        return requests.isEmpty();
    }

    private void handle(HttpExchange exchange) throws IOException {
        final ByteArrayOutputStream body = new ByteArrayOutputStream();
        exchange.getRequestBody().transferTo(body);
        final String type = exchange.getRequestHeaders().getFirst("Content-Type");
        final Request request =
                new Request(
                        exchange.getRequestURI().getPath(),
                        exchange.getRequestURI().getQuery(),
                        type != null && type.contains("boundary=")
                                ? parse(body.toString("ISO-8859-1"), boundary(type))
                                : new LinkedHashMap<>());
        if (answers) {
            if (status == 503) {
                exchange.getResponseHeaders().set("Retry-After", "1");
            }
            exchange.sendResponseHeaders(status, -1);
            exchange.close();
        }
        requests.add(request); // answered by now: the test may end
    }

    private static String boundary(String type) {
        return type.substring(type.indexOf("boundary=") + 9).replace("\"", "");
    }

    private static Map<String, byte[]> parse(String body, String boundary) {
        final Map<String, byte[]> parts = new LinkedHashMap<>();
        final String[] pieces = ("\r\n" + body).split("\r\n--" + boundary, -1);
        assertTrue("not closed: " + body, pieces[pieces.length - 1].startsWith("--"));
        for (int i = 1; i < pieces.length - 1; i++) {
            final int end = pieces[i].indexOf("\r\n\r\n");
            final String header = pieces[i].substring(0, end);
            final int name = header.indexOf("name=\"") + 6;
            parts.put(
                    header.substring(name, header.indexOf('"', name)),
                    pieces[i].substring(end + 4).getBytes(StandardCharsets.ISO_8859_1));
        }
        return parts;
    }

    @Override
    public void close() {
        server.stop(0);
        threads.shutdownNow();
    }
}
