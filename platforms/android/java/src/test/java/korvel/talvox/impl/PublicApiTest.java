package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.io.IOException;
import java.lang.reflect.Field;
import java.lang.reflect.Member;
import java.lang.reflect.Modifier;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;
import java.util.TreeSet;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import korvel.talvox.support.KitTest;
import korvel.talvox.support.PublicApi;
import org.junit.Test;

/**
 * The public API against the list of the last release. A line that is gone breaks applications that
 * were built against that release; a new one is to be added to the list, which is reviewed like code.
 * {@code -Dtalvox.api.update=true} writes the list.
 */
public class PublicApiTest extends KitTest {
    private static final Path LIST =
            Paths.get(System.getProperty("talvox.root"), "platforms/android/package/api.txt");

    private static TreeSet<String> describeApi() throws Exception {
        final TreeSet<String> lines = new TreeSet<>();
        for (Class<?> type : PublicApi.findClasses()) {
            lines.add(describe(type));
            Stream.of(
                            type.getDeclaredMethods(),
                            type.getDeclaredConstructors())
                    .flatMap(Arrays::stream)
                    .filter(PublicApiTest::isVisible)
                    .forEach(member -> lines.add(member.toGenericString()));
            for (Field field : type.getDeclaredFields()) {
                if (isVisible(field)) {
                    lines.add(field.toGenericString() + describeConstant(field));
                }
            }
        }
        return lines;
    }

    private static boolean isVisible(Member member) {
        return !member.isSynthetic()
                && (Modifier.isPublic(member.getModifiers())
                        || Modifier.isProtected(member.getModifiers()));
    }

    private static String describe(Class<?> type) {
        return type.toGenericString()
                + " extends "
                + type.getGenericSuperclass()
                + Arrays.toString(type.getGenericInterfaces());
    }

    /** Compilers copy the value of a constant into the application. */
    private static String describeConstant(Field field) throws IllegalAccessException {
        final boolean isConstant =
                Modifier.isStatic(field.getModifiers())
                        && Modifier.isFinal(field.getModifiers())
                        && (field.getType().isPrimitive() || field.getType() == String.class);
        return isConstant ? " = " + field.get(null) : "";
    }

    private static List<String> readList() throws IOException {
        return Files.readAllLines(LIST, StandardCharsets.UTF_8).stream()
                .filter(line -> !line.startsWith("#"))
                .collect(Collectors.toList());
    }

    private static void writeList(TreeSet<String> lines) throws IOException {
        final List<String> text = new ArrayList<>();
        text.add("# The public API of the Java kit, sorted: see PublicApiTest.");
        text.addAll(lines);
        Files.write(LIST, text, StandardCharsets.UTF_8);
    }

    @Test
    public void isThatOfTheList() throws Exception {
        final TreeSet<String> now = describeApi();
        assertTrue("only " + now.size() + " lines", now.size() > 100);
        if (Boolean.getBoolean("talvox.api.update")) {
            writeList(now);
        }
        final TreeSet<String> gone = new TreeSet<>(readList());
        gone.removeAll(now);
        final TreeSet<String> added = new TreeSet<>(now);
        added.removeAll(readList());
        assertEquals("gone, which breaks applications: " + gone, 0, gone.size());
        assertEquals("new, not in " + LIST.getFileName() + ": " + added, 0, added.size());
    }
}
