package korvel.talvox.support;

import static org.junit.Assert.fail;

import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Paths;

/** What this process holds; the Java heap has all of its memory from the start. */
public final class ResidentMemory {
    private static final int ROUNDS = 5;

    private ResidentMemory() {}

    /** The same work each time. */
    public interface Round {
        void run() throws Exception;
    }

    private static long getKib() throws IOException {
        for (String line : Files.readAllLines(Paths.get("/proc/self/status"))) {
            if (line.startsWith("VmRSS:")) {
                return Long.parseLong(line.replaceAll("\\D", ""));
            }
        }
        throw new IOException("no VmRSS");
    }

    /**
     * Fails when the process grows by so much in every round. The VM grows, too, as long as it
     * compiles what runs often, but not for ever.
     */
    public static void assertDoesNotGrow(long kib, Round round) throws Exception {
        final StringBuilder grown = new StringBuilder();
        for (int index = 0; index < ROUNDS; index++) {
            System.gc();
            final long before = getKib();
            round.run();
            System.gc();
            final long more = getKib() - before;
            if (more < kib) {
                return;
            }
            grown.append(' ').append(more);
        }
        fail("grown in each round by KiB:" + grown);
    }
}
