package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.io.IOException;
import java.io.StringWriter;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.Arrays;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import javax.tools.JavaCompiler;
import javax.tools.StandardJavaFileManager;
import javax.tools.ToolProvider;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/** The sample application compiles, and is the one that the README shows. */
public class SampleApplicationTest {
    private static final Path ROOT = Paths.get(System.getProperty("talvox.root"));
    private static final Path SAMPLE = ROOT.resolve("samples/android");
    private static final Path ACTIVITY =
            SAMPLE.resolve("app/src/main/java/org/example/dictation/DictationActivity.java");

    @Rule public final TemporaryFolder output = new TemporaryFolder();

    private static String read(Path file) throws IOException {
        return new String(Files.readAllBytes(file), StandardCharsets.UTF_8);
    }

    private static String find(String pattern, String text) {
        final Matcher matcher = Pattern.compile(pattern, Pattern.DOTALL).matcher(text);
        assertTrue(pattern, matcher.find());
        return matcher.group(1);
    }

    @Test
    public void compilesAgainstTheFrameworkAndTheKit() throws IOException {
        final JavaCompiler compiler = ToolProvider.getSystemJavaCompiler();
        final StringWriter complaints = new StringWriter();
        final String classPath =
                System.getProperty(
                        "surefire.test.class.path", System.getProperty("java.class.path"));
        try (StandardJavaFileManager files = compiler.getStandardFileManager(null, null, null)) {
            final boolean compiled =
                    compiler.getTask(
                                    complaints,
                                    files,
                                    null,
                                    Arrays.asList(
                                            "-classpath",
                                            classPath,
                                            "-Xlint:deprecation",
                                            "-proc:none",
                                            "-d",
                                            output.getRoot().getPath()),
                                    null,
                                    files.getJavaFileObjects(ACTIVITY.toFile()))
                            .call();
            assertTrue(complaints.toString(), compiled);
        }
        assertEquals("", complaints.toString());
    }

    @Test
    public void isTheOneInTheReadme() throws IOException {
        final String shown =
                find("```java\n(public class DictationActivity.*?)```", read(ROOT.resolve("README.md")));
        assertTrue(read(ACTIVITY).endsWith(shown));
    }

    @Test
    public void usesTheCoordinatesAndTheVersionOfTheProject() throws IOException {
        final String version =
                find(
                        "project\\(KorvelTalvox VERSION ([0-9.]+)",
                        read(ROOT.resolve("CMakeLists.txt")));
        final String dependency = "implementation(\"org.korvel:talvox:" + version + "\")";
        final String repository = "maven { url = uri(\"../../build/maven\") }";
        final String readme = read(ROOT.resolve("README.md"));
        assertTrue(read(SAMPLE.resolve("app/build.gradle")).contains(dependency));
        assertTrue(read(SAMPLE.resolve("settings.gradle")).contains(repository));
        assertTrue(readme.contains(dependency));
        assertTrue(readme.contains("maven { url = uri(\""));
    }
}
