package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import java.io.File;
import java.nio.file.Files;
import java.util.concurrent.TimeUnit;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/**
 * Sessions of the kit in which native calls fail: one end, or a start that says no, and a session
 * that follows and is right. Each test has a JVM of its own, so its first points fail at the first
 * use of the library.
 */
public class TortureTest {
    private static final int PATIENCE_S = 240;

    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    /** Fails so many calls of a kind, from the first one on, at this distance from each other. */
    private void torture(int kind, int points, int distance, String how) throws Exception {
        final String libraries = System.getProperty("talvox.library.path");
        final File output = folder.newFile();
        final ProcessBuilder builder =
                new ProcessBuilder(
                        System.getProperty("java.home") + "/bin/java",
                        "-Xcheck:jni",
                        "-Djava.library.path=" + libraries,
                        "-cp",
                        System.getProperty(
                                "surefire.test.class.path", System.getProperty("java.class.path")),
                        TorturedProgram.class.getName(),
                        String.valueOf(kind),
                        "1",
                        String.valueOf(points),
                        String.valueOf(distance),
                        how);
        builder.environment().put("LD_PRELOAD", libraries + "/libtalvox_torture.so");
        final Process program =
                builder.redirectErrorStream(true).redirectOutput(output).start();
        try {
            final boolean hasEnded = program.waitFor(PATIENCE_S, TimeUnit.SECONDS);
            final String log = new String(Files.readAllBytes(output.toPath()));
            assertTrue("it does not end: " + log, hasEnded);
            assertEquals(log, 0, program.exitValue());
            assertFalse(log, log.contains("in native method"));
            final Matcher summary = Pattern.compile("(\\d+) points, (\\d+) failures").matcher(log);
            assertTrue(log, summary.find());
            assertEquals(points, Integer.parseInt(summary.group(1)));
            assertTrue(log, Integer.parseInt(summary.group(2)) > 0);
        } finally {
            program.destroyForcibly();
        }
    }

    @Test
    public void memoryIsScarceOnce() throws Exception {
        torture(TortureProbe.MEMORY, 40, 13, "once");
    }

    @Test
    public void memoryStaysScarce() throws Exception {
        torture(TortureProbe.MEMORY, 20, 29, "onward");
    }

    @Test
    public void threadsAreScarce() throws Exception {
        torture(TortureProbe.THREADS, 4, 1, "once");
    }

    @Test
    public void descriptorsAreScarce() throws Exception {
        torture(TortureProbe.DESCRIPTORS, 4, 1, "once");
    }

    @Test
    public void socketsFail() throws Exception {
        torture(TortureProbe.SOCKETS, 20, 1, "onward");
    }
}
