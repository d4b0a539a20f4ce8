package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import java.io.File;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.concurrent.TimeUnit;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import javax.tools.ToolProvider;
import org.junit.Before;
import org.junit.BeforeClass;
import org.junit.ClassRule;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/**
 * The library in applications that have no class of the kit: only their own declarations of the
 * native methods, and of what these call. Nothing that such an application does ends its VM.
 * Each program, in {@code src/test/bare}, runs in a JVM of its own.
 */
public class BareApplicationTest {
    private static final int PATIENCE_S = 60;
    private static final String[] NEXT = {"next", "onResults 1 next=-1.0"};

    @ClassRule public static final TemporaryFolder CLASSES = new TemporaryFolder();
    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    private Path output;
    private Path log;

    private static String framework() {
        return Stream.of(
                        System.getProperty(
                                        "surefire.test.class.path",
                                        System.getProperty("java.class.path"))
                                .split(File.pathSeparator))
                .filter(entry -> Paths.get(entry).getFileName().toString().startsWith("android-all-"))
                .findFirst()
                .orElseThrow(() -> new AssertionError("no framework in the class path"));
    }

    @BeforeClass
    public static void compile() throws IOException {
        final Path sources =
                Paths.get(
                        System.getProperty("talvox.root"), "platforms/android/java/src/test/bare");
        final List<String> arguments =
                new ArrayList<>(
                        Arrays.asList(
                                "-d", CLASSES.getRoot().getPath(), "-classpath", framework()));
        try (Stream<Path> files = Files.walk(sources)) {
            files.map(Path::toString).filter(name -> name.endsWith(".java")).forEach(arguments::add);
        }
        assertEquals(
                0,
                ToolProvider.getSystemJavaCompiler()
                        .run(null, null, null, arguments.toArray(new String[0])));
    }

    @Before
    public void createOutput() throws IOException {
        output = folder.newFile().toPath();
        log = folder.newFile().toPath();
    }

    private static String read(Path file) {
        try {
            return new String(Files.readAllBytes(file), StandardCharsets.UTF_8);
        } catch (IOException failure) {
            throw new AssertionError(failure);
        }
    }

    /** Runs a program; its lines must be these. */
    private void expect(List<String> command, String... lines) throws Exception {
        final List<String> all =
                new ArrayList<>(
                        Arrays.asList(
                                Paths.get(System.getProperty("java.home"), "bin", "java")
                                        .toString(),
                                "-Xcheck:jni",
                                "-Djava.library.path="
                                        + System.getProperty("talvox.library.path")));
        all.addAll(command);
        final Process program =
                new ProcessBuilder(all)
                        .redirectOutput(output.toFile())
                        .redirectError(log.toFile())
                        .start();
        try {
            assertTrue(
                    "it does not end: " + read(log), program.waitFor(PATIENCE_S, TimeUnit.SECONDS));
        } finally {
            program.destroyForcibly();
        }
        assertEquals(read(log), Arrays.asList(lines), Files.readAllLines(output));
        assertEquals(0, program.exitValue());
        assertFalse(read(output), read(output).contains("WARNING"));
    }

    /** Runs the program of this misuse, after which the next session must have its results. */
    private void expectThenNext(String misuse, String... lines) throws Exception {
        final List<String> command =
                new ArrayList<>(
                        Arrays.asList(
                                "-classpath",
                                CLASSES.getRoot() + File.pathSeparator + framework(),
                                "-Xmx32m",
                                "bare.Program"));
        command.addAll(Arrays.asList(misuse.split(" ")));
        expect(
                command,
                Stream.concat(Stream.of(lines), Stream.of(NEXT)).toArray(String[]::new));
    }

    private void assertLogged(int times, String text) {
        final long found =
                Files.exists(log)
                        ? Stream.of(read(log).split("\n")).filter(line -> line.contains(text)).count()
                        : 0;
        assertEquals(text + " in\n" + read(log), times, found);
    }

    @Test
    public void loadsWithoutTheBackEnds() throws Exception {
        expectThenNext("languages", "[aa, ru-RU, tr-TR, uk-UA, xx-XX]");
        assertLogged(1, "CoreApplication.onLibraryLoaded, the back ends in Java stay off");
        assertLogged(1, "PlatformRecognizer: 3 of 5 languages are not texts, ignored");
    }

    @Test
    public void loadsWithoutAnyOfItsClasses() throws Exception {
        final Path only = folder.newFolder("bare").toPath();
        Files.copy(
                CLASSES.getRoot().toPath().resolve("bare/Loader.class"),
                only.resolve("Loader.class"));
        expect(Arrays.asList("-classpath", folder.getRoot().getPath(), "bare.Loader"), "loaded");
        assertLogged(1, "JNI_OnLoad: none of the classes with native methods is there");
        assertLogged(1, "CoreApplication.onLibraryLoaded, the back ends in Java stay off");
    }

    @Test
    public void languagesThatThrowAreNone() throws Exception {
        expectThenNext("noLanguages", "[ru-RU, tr-TR, uk-UA]");
    }

    @Test
    public void scoresOfAnotherLengthThanTheTextsAreOneError() throws Exception {
        expectThenNext("scores", "onError 0", "onError 0");
        // The second report of the same place is counted only.
        assertLogged(
                1,
                "assertion failed: !jconfidenceScores || ( jenv->GetArrayLength(strings) == "
                        + "jenv->GetArrayLength(jconfidenceScores)) "
                        + "(platforms/android/jni/PlatformRecognizer:");
    }

    @Test
    public void partialResultsThatDoNotFitTogetherAreReportedOnly() throws Exception {
        expectThenNext("partial", "onResults 1 a=-1.0");
        assertLogged(1, "assertion failed: !jconfidenceScores");
    }

    @Test
    public void numbersThatAreNotErrorCodesAreUnknownErrors() throws Exception {
        expectThenNext(
                "codes", "onError 0", "onError 0", "onError 0", "onError 0", "onError 0");
        for (int code : new int[] {-2, 9, 100, Integer.MIN_VALUE, Integer.MAX_VALUE}) {
            assertLogged(
                    1,
                    "PlatformRecognizer: "
                            + code
                            + " is not an error code, reporting ErrorUnknown");
        }
        assertLogged(5, "Recognizer error: 0, ErrorUnknown");
    }

    @Test
    public void aConstructorThatThrowsIsNotAvailable() throws Exception {
        expectThenNext("new", "onError 7", "calls: ");
        assertLogged(1, "assertion failed: jobj (platforms/android/jni/PlatformRecognizer:");
    }

    @Test
    public void aStartThatThrowsIsNotAvailable() throws Exception {
        expectThenNext("start", "onError 7", "calls: new cancel ");
    }

    @Test
    public void aStopThatThrowsIsOneErrorAndCancels() throws Exception {
        expectThenNext("stop", "onError 0", "calls: new start cancel ");
        assertLogged(1, "PlatformRecognizer.stop: java.lang.IllegalArgumentException: stop throws");
    }

    @Test
    public void aCancelThatThrowsIsCancelled() throws Exception {
        expectThenNext("cancel", "onError 5", "calls: new start ");
    }

    @Test
    public void propertiesThatThrowCostNoResults() throws Exception {
        expectThenNext(
                "properties",
                "onResults 1 a=-1.0",
                "calls: new start getLanguagePreference getModel cancel ",
                "onResults 1 a=-1.0",
                "calls: new start getSource getModel cancel ",
                "onResults 1 a=-1.0",
                "calls: new start getSource getLanguagePreference cancel ");
    }

    @Test
    public void nullsAreNoHypotheses() throws Exception {
        expectThenNext("nulls", "onError 0", "onResults 2 a=0.9 b=0.2", "onResults 0");
        assertLogged(1, "PlatformRecognizer: results without an array of texts");
        assertLogged(1, "PlatformRecognizer: 1 of 3 hypotheses are null, ignored");
    }

    @Test
    public void staleHandlesAreExceptions() throws Exception {
        final List<String> lines = new ArrayList<>();
        lines.add("onError 5");
        for (int handle = 0; handle < 3; handle++) {
            lines.addAll(
                    Stream.generate(() -> "IllegalStateException")
                            .limit(5)
                            .collect(Collectors.toList()));
            lines.add("returns");
        }
        expectThenNext("stale", lines.toArray(new String[0]));
    }

    /** A JVM makes no local frame for more than 65,536 references. */
    @Test
    public void resultsArriveWhateverTheirNumber() throws Exception {
        for (int count : new int[] {65_526, 65_527, 100_000}) {
            expectThenNext("many " + count, "onResults " + count + " w=-1.0 w=-1.0 w=-1.0");
        }
    }

    @Test
    public void resultsThatJavaHasNoRoomForAreOneError() throws Exception {
        expectThenNext("full 20000", "onError 0");
        assertLogged(1, "onResults: no room for 20000 hypotheses in Java, reporting ErrorUnknown");
    }
}
