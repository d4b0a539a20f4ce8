package korvel.talvox.support;

import java.io.IOException;
import java.lang.reflect.Modifier;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import korvel.core.SoundInput;

/** The classes that applications may use. */
public final class PublicApi {
    private static final Path CLASSES = Paths.get(System.getProperty("talvox.classes"));
    private static final List<String> PACKAGES =
            Arrays.asList("korvel/talvox", "korvel/talvox/util", "korvel/talvox/proximity");
    private static final List<Class<?>> OTHERS =
            Arrays.asList(SoundInput.class, SoundInput.Factory.class);

    private PublicApi() {}

    /** Sorted by package and name. */
    public static List<Class<?>> findClasses() throws IOException, ClassNotFoundException {
        final List<Class<?>> found = new ArrayList<>(OTHERS);
        for (String name : PACKAGES) {
            for (Path file : list(CLASSES.resolve(name))) {
                final String path = CLASSES.relativize(file).toString();
                if (path.endsWith(".class") && !path.endsWith("-info.class")) {
                    final Class<?> type =
                            Class.forName(
                                    path.substring(0, path.length() - ".class".length())
                                            .replace('/', '.'));
                    if (isPublic(type)) {
                        found.add(type);
                    }
                }
            }
        }
        return found;
    }

    private static List<Path> list(Path directory) throws IOException {
        try (Stream<Path> files = Files.list(directory)) {
            return files.sorted().collect(Collectors.toList());
        }
    }

    private static boolean isPublic(Class<?> type) {
        return Modifier.isPublic(type.getModifiers())
                && (type.getEnclosingClass() == null || isPublic(type.getEnclosingClass()));
    }
}
