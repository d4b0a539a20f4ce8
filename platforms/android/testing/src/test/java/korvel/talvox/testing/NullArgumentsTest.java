package korvel.talvox.testing;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.lang.reflect.Modifier;
import java.net.URL;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.Collections;
import java.util.List;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import korvel.talvox.ErrorDetail;
import korvel.talvox.Hypothesis;
import korvel.talvox.Outcome;
import korvel.talvox.Recognition;
import korvel.talvox.RecorderState;
import korvel.talvox.SpeechError;
import korvel.talvox.support.NullArguments;
import org.junit.Test;

/** Every argument of the test kit that must not be null is refused when it is, by its name. */
public class NullArgumentsTest {
    private static List<Class<?>> findPublicClasses() throws Exception {
        final URL classes = FakeEngine.class.getProtectionDomain().getCodeSource().getLocation();
        final Path folder = Paths.get(classes.toURI()).resolve("korvel/talvox/testing");
        try (Stream<Path> files = Files.list(folder)) {
            return files.map(file -> file.getFileName().toString())
                    .filter(name -> name.endsWith(".class") && !name.startsWith("package-info"))
                    .sorted()
                    .map(name -> load(name.substring(0, name.length() - ".class".length())))
                    .filter(type -> Modifier.isPublic(type.getModifiers()))
                    .collect(Collectors.toList());
        }
    }

    private static Class<?> load(String name) {
        try {
            return Class.forName("korvel.talvox.testing." + name);
        } catch (ClassNotFoundException missing) {
            throw new AssertionError(missing);
        }
    }

    @Test
    public void nullIsRefusedByName() throws Exception {
        final NullArguments nulls = new NullArguments();
        nulls.addSample(byte[].class, new byte[2]);
        nulls.addSample(Hypothesis.class, new HypothesisBuilder("text").build());
        nulls.addSample(Outcome.class, Outcome.UNCERTAIN);
        nulls.addSample(Recognition.class, RecognitionBuilder.empty());
        nulls.addSample(RecorderState.class, RecorderState.RECORDING);
        nulls.addSample(SpeechError.class, SpeechError.NETWORK);
        nulls.addSample(ErrorDetail.class, new ErrorDetailBuilder().build());
        nulls.addSample(ErrorDetailBuilder.class, new ErrorDetailBuilder());
        nulls.addSample(HypothesisBuilder.class, new HypothesisBuilder("text"));
        nulls.addSample(RecognitionBuilder.class, new RecognitionBuilder(Outcome.UNCERTAIN));
        nulls.addSample(Script.Builder.class, Script.cloud().recordingBegin());
        try (FakeEngine fake = new FakeEngine()) {
            nulls.addSample(FakeEngine.class, fake);
            for (Class<?> type : findPublicClasses()) {
                nulls.checkCallsOf(type);
            }
            assertTrue(fake.getEngine().getAvailableLanguages().isEmpty());
        }
        assertEquals(Collections.emptyList(), nulls.getFaults());
        assertTrue("only " + nulls.getCalls() + " calls", nulls.getCalls() >= 12);
    }
}
