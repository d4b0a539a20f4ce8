package korvel.talvox.impl;

import android.os.Bundle;
import com.sun.net.httpserver.HttpServer;
import java.net.InetAddress;
import java.net.InetSocketAddress;
import java.nio.charset.StandardCharsets;
import java.util.ArrayList;
import java.util.Base64;
import java.util.List;
import java.util.concurrent.BlockingQueue;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.Executors;
import java.util.concurrent.LinkedBlockingQueue;
import java.util.concurrent.Semaphore;
import java.util.concurrent.TimeUnit;
import korvel.core.AudioRecorderBackend;
import korvel.core.SoundInput;

/**
 * A program on a plain JVM, with {@code libtalvox_torture} preloaded: one session in which a native
 * call fails, and one after it in which none does, again and again. Its arguments are the kind of
 * calls, the first call that fails, how many points there are, the distance from one to the next, and
 * "once" or "onward". It prints each fault, and exits with 1 if there was one.
 */
final class TorturedProgram {
    private static final int PIECE_MS = 20;
    private static final int PIECES = 40;
    private static final int STEP_MS = 500;

    /** 20 s of sound and 20 s for the answer, in steps of the clock. */
    private static final int LONGEST_MS = 41_000;

    private static final int POLL_MS = 5;
    private static final int PATIENCE_MS = 20_000;

    /** For an answer that a failure may have lost: then the clock has to move. */
    private static final int SHORT_PATIENCE_MS = 20;

    /** Silence, piece by piece, as far as it is let. One for each recording. */
    private static final class Feed implements SoundInput {
        private final Semaphore due = new Semaphore(0);
        private final Semaphore taken = new Semaphore(0);
        private final CountDownLatch closed = new CountDownLatch(1);
        private boolean hasDelivered;

        /** Returns false when the recording is over. */
        boolean deliver() throws InterruptedException {
            due.release();
            return taken.tryAcquire(PATIENCE_MS, TimeUnit.MILLISECONDS) && closed.getCount() > 0;
        }

        /** Lets a recording that has been stopped come to its end. */
        void end() throws InterruptedException {
            due.release(PIECES);
            closed.await();
        }

        @Override
        public int read(byte[] buffer, int sizeInBytes) {
            if (hasDelivered) {
                taken.release();
            }
            hasDelivered = true;
            due.acquireUninterruptibly();
            return sizeInBytes;
        }

        @Override
        public void close() {
            closed.countDown();
            taken.release();
        }
    }

    /** Counts the ends. */
    private static final class Listener extends SilentEvents {
        private final CountDownLatch ended = new CountDownLatch(1);
        private final List<String> ends = new ArrayList<>();

        private synchronized void end(String how) {
            ends.add(how);
            ended.countDown();
        }

        synchronized List<String> getEnds() {
            return new ArrayList<>(ends);
        }

        boolean waitForEnd(int milliseconds) throws InterruptedException {
            return ended.await(milliseconds, TimeUnit.MILLISECONDS);
        }

        @Override
        public void onError(int code) {
            end("error " + code);
        }

        @Override
        public void onResults(
                int outcome, String[] texts, float[] confidences, String requestId) {
            end("results " + String.join("/", texts));
        }
    }

    private static final List<String> FAULTS = new ArrayList<>();
    private static final BlockingQueue<Feed> FEEDS = new LinkedBlockingQueue<>();

    private TorturedProgram() {}

    private static HttpServer startGateway() throws Exception {
        final HttpServer gateway =
                HttpServer.create(new InetSocketAddress(InetAddress.getLoopbackAddress(), 0), 0);
        final String document =
                "<recognitionResults success=\"1\"><variant confidence=\"0.95\">go</variant>"
                        + "</recognitionResults>";
        final String results =
                Base64.getEncoder().encodeToString(document.getBytes(StandardCharsets.UTF_8));
        gateway.createContext(
                "/",
                exchange -> {
                    exchange.getRequestBody().readAllBytes();
                    exchange.getResponseHeaders().set("x-asrgw-recognition-results", results);
                    exchange.sendResponseHeaders(200, -1);
                    exchange.close();
                });
        gateway.setExecutor(
                Executors.newCachedThreadPool(
                        task -> {
                            final Thread thread = new Thread(task);
                            thread.setDaemon(true);
                            return thread;
                        }));
        gateway.start();
        return gateway;
    }

    /** The input of the recording that has begun; null where the session ends before. */
    private static Feed awaitFeed(Listener listener) throws InterruptedException {
        Feed feed = FEEDS.poll();
        for (int waited = 0; feed == null && waited < PATIENCE_MS; waited += POLL_MS) {
            if (listener.waitForEnd(0)) {
                return FEEDS.poll();
            }
            feed = FEEDS.poll(POLL_MS, TimeUnit.MILLISECONDS);
        }
        return feed;
    }

    /** Returns false if the recording is over before. */
    private static boolean play(Feed feed) throws InterruptedException {
        for (int piece = 0; piece < PIECES; piece++) {
            if (!feed.deliver()) {
                return false;
            }
            TortureProbe.advanceMs(PIECE_MS);
        }
        return true;
    }

    /** Plays to the session's recording; those of the session before may still come to their end. */
    private static Feed playToSession(Listener listener) throws InterruptedException {
        Feed feed = awaitFeed(listener);
        while (feed != null && !play(feed)) {
            feed.end();
            feed = awaitFeed(listener);
        }
        return feed;
    }

    private static void awaitEnd(Listener listener, int patienceMs) throws InterruptedException {
        for (int waited = 0; waited < LONGEST_MS; waited += STEP_MS) {
            if (listener.waitForEnd(patienceMs)) {
                return;
            }
            TortureProbe.advanceMs(STEP_MS);
        }
    }

    /** How the session ended; a start that throws is an end, too. */
    private static List<String> run(int patienceMs) throws InterruptedException {
        final Listener listener = new Listener();
        final NativeHandle session;
        try {
            session = Recognizer.start(Talvox.getHandle(), new Bundle(), listener);
        } catch (RuntimeException | OutOfMemoryError refusal) {
            listener.end("refused");
            return listener.getEnds();
        }
        final Feed feed = playToSession(listener);
        try {
            Recognizer.stop(session);
        } catch (RuntimeException | OutOfMemoryError failure) {
            FAULTS.add("stop: " + failure);
        }
        awaitEnd(listener, patienceMs);
        TortureProbe.disarm();
        TortureProbe.advanceMs(STEP_MS);
        session.close();
        if (feed != null) {
            feed.end();
        }
        return listener.getEnds();
    }

    private static void check(String what, boolean isRight, List<String> ends) {
        if (!isRight) {
            FAULTS.add(what + ": " + ends);
        }
    }

    private static void runPoint(int kind, long call, boolean onward) throws InterruptedException {
        final String name = "call " + call;
        TortureProbe.arm(kind, call, onward);
        final List<String> ends = run(SHORT_PATIENCE_MS);
        TortureProbe.disarm();
        check(name, ends.size() == 1, ends);
        final List<String> next = run(PATIENCE_MS);
        check(name + ", the session that follows", next.equals(List.of("results go")), next);
    }

    public static void main(String[] arguments) {
        try {
            runAll(arguments);
        } catch (Throwable failure) {
            failure.printStackTrace();
            System.exit(2);
        }
    }

    private static void runAll(String[] arguments) throws Exception {
        final int kind = Integer.parseInt(arguments[0]);
        final long first = Long.parseLong(arguments[1]);
        final long points = Long.parseLong(arguments[2]);
        final long distance = Long.parseLong(arguments[3]);
        final boolean onward = arguments[4].equals("onward");
        if (!TortureProbe.prepare()) {
            throw new IllegalStateException("the library is not preloaded");
        }
        AudioRecorderBackend.setInputFactory(
                (rate, length, mode) -> {
                    final Feed feed = new Feed();
                    FEEDS.add(feed);
                    return feed;
                });
        final HttpServer gateway = startGateway();
        Talvox.updateSettingsFromXml(
                Talvox.getHandle(),
                "<startup><features><voice><url>http://127.0.0.1:"
                        + gateway.getAddress().getPort()
                        + "</url><uuid>0123456789abcdef0123456789abcdef</uuid>"
                        + "<language>en-US</language>"
                        + "</voice></features></startup>");
        int failures = 0;
        for (long point = 0; point < points; point++) {
            runPoint(kind, first + point * distance, onward);
            failures += TortureProbe.hasFailed() ? 1 : 0;
        }
        gateway.stop(0);
        FAULTS.forEach(System.out::println);
        System.out.println(points + " points, " + failures + " failures");
        System.exit(FAULTS.isEmpty() ? 0 : 1);
    }
}
