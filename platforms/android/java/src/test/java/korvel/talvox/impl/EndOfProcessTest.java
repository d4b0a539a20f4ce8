package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.io.File;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.concurrent.TimeUnit;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;

/** A JVM may end at any time: nobody waits for a recording, and nothing calls a VM that is gone. */
public class EndOfProcessTest {
    private static final int PATIENCE_S = 60;

    private Path output;

    @Before
    public void createOutput() throws IOException {
        output = Files.createTempFile("talvox", ".log");
    }

    @After
    public void deleteOutput() throws IOException {
        Files.delete(output);
    }

    /** The exit status of the program; its output must show no complaint of the VM. */
    private int run(String ending) throws IOException, InterruptedException {
        final Process program =
                new ProcessBuilder(
                                Paths.get(System.getProperty("java.home"), "bin", "java")
                                        .toString(),
                                "-Xcheck:jni",
                                "-Djava.library.path="
                                        + System.getProperty("talvox.library.path"),
                                "-cp",
                                System.getProperty(
                                        "surefire.test.class.path",
                                        System.getProperty("java.class.path")),
                                EndingProgram.class.getName(),
                                ending)
                        .redirectErrorStream(true)
                        .redirectOutput(new File(output.toString()))
                        .start();
        try {
            final boolean hasEnded = program.waitFor(PATIENCE_S, TimeUnit.SECONDS);
            final String log = new String(Files.readAllBytes(output));
            assertTrue("it does not end: " + log, hasEnded);
            assertTrue(log, !log.contains("WARNING") && !log.contains("FATAL"));
            return program.exitValue();
        } finally {
            program.destroyForcibly();
        }
    }

    @Test
    public void returnsFromMainWhileItRecords() throws Exception {
        assertEquals(0, run("return"));
    }

    @Test
    public void exitsWhileItRecords() throws Exception {
        assertEquals(EndingProgram.EXIT_STATUS, run("exit"));
    }

    @Test
    public void exitsWhileTheMicrophoneHangs() throws Exception {
        assertEquals(EndingProgram.EXIT_STATUS, run("hang"));
    }
}
