package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.Collections;
import java.util.List;
import java.util.Locale;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import org.junit.Test;

/** Applications in Java get nothing of Kotlin: neither the kit's classes nor its POM name it. */
public class JavaArtefactTest {
    private static final Path CLASSES = Paths.get(System.getProperty("talvox.classes"));
    private static final Path POM =
            Paths.get(System.getProperty("talvox.root"), "platforms/android/java/pom.xml");

    private static boolean namesKotlin(Path file) {
        try {
            return new String(Files.readAllBytes(file), StandardCharsets.ISO_8859_1)
                    .toLowerCase(Locale.ROOT)
                    .contains("kotlin");
        } catch (IOException failure) {
            throw new AssertionError(failure);
        }
    }

    @Test
    public void namesNothingOfKotlin() throws IOException {
        final List<Path> files;
        try (Stream<Path> all = Files.walk(CLASSES)) {
            files = all.filter(Files::isRegularFile).collect(Collectors.toList());
        }
        assertTrue("only " + files.size() + " files", files.size() > 40);
        files.add(POM);
        assertEquals(
                Collections.emptyList(),
                files.stream().filter(JavaArtefactTest::namesKotlin).collect(Collectors.toList()));
    }
}
