package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import java.io.BufferedReader;
import java.io.IOException;
import java.io.InputStreamReader;
import java.lang.reflect.Constructor;
import java.lang.reflect.Executable;
import java.lang.reflect.Field;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.List;
import java.util.Set;
import java.util.TreeSet;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import korvel.talvox.support.KitTest;
import org.junit.Test;

/** What Java and native code call by name is there on the other side. */
public class NativeNamesTest extends KitTest {
    private static final Path CLASSES = Paths.get(System.getProperty("talvox.classes"));
    private static final Path SOURCES =
            Paths.get(System.getProperty("talvox.root"), "platforms/android/jni");
    private static final Path RULES =
            Paths.get(
                    System.getProperty("talvox.root"),
                    "platforms/android/java/consumer-rules.pro");
    private static final Path LIBRARY =
            Paths.get(System.getProperty("talvox.library.path"), "libKorvelTalvox.so");

    private static Class<?> load(String name) throws ClassNotFoundException {
        return Class.forName(name.replace('/', '.'), false, NativeNamesTest.class.getClassLoader());
    }

    private static List<Class<?>> kitClasses() throws Exception {
        final List<Class<?>> classes = new ArrayList<>();
        try (Stream<Path> files = Files.walk(CLASSES)) {
            for (Path file : files.collect(Collectors.toList())) {
                final String name = CLASSES.relativize(file).toString();
                if (name.endsWith(".class")) {
                    classes.add(load(name.substring(0, name.length() - ".class".length())));
                }
            }
        }
        assertFalse(classes.isEmpty());
        return classes;
    }

    private static String mangle(String name) {
        return name.replace("_", "_1").replace('.', '_').replace("$", "_00024");
    }

    private static Set<String> exportedSymbols() throws IOException, InterruptedException {
        final Process nm =
                new ProcessBuilder("nm", "-D", "--defined-only", LIBRARY.toString()).start();
        final Set<String> symbols = new TreeSet<>();
        try (BufferedReader lines =
                new BufferedReader(
                        new InputStreamReader(nm.getInputStream(), StandardCharsets.UTF_8))) {
            lines.lines()
                    .map(line -> line.substring(line.lastIndexOf(' ') + 1))
                    .filter(name -> name.startsWith("Java_"))
                    .forEach(symbols::add);
        }
        assertEquals(0, nm.waitFor());
        return symbols;
    }

    @Test
    public void theLibraryExportsExactlyTheDeclaredNativeMethods() throws Exception {
        final Set<String> declared = new TreeSet<>();
        for (Class<?> type : kitClasses()) {
            for (Method method : type.getDeclaredMethods()) {
                if (Modifier.isNative(method.getModifiers())) {
                    assertTrue(method + " is not static", Modifier.isStatic(method.getModifiers()));
                    declared.add(
                            "Java_" + mangle(type.getName()) + "_" + mangle(method.getName()));
                }
            }
        }
        assertEquals(declared, exportedSymbols());
    }

    private static String nativeSources() throws IOException {
        final StringBuilder text = new StringBuilder();
        try (Stream<Path> files = Files.walk(SOURCES)) {
            for (Path file : files.collect(Collectors.toList())) {
                if (file.toString().endsWith(".cpp") || file.toString().endsWith(".h")) {
                    text.append(
                            new String(Files.readAllBytes(file), StandardCharsets.UTF_8));
                }
            }
        }
        return text.toString();
    }

    private static Set<String> findAll(String pattern, String text) {
        final Set<String> found = new TreeSet<>();
        final Matcher matcher = Pattern.compile(pattern).matcher(text);
        while (matcher.find()) {
            found.add(
                    matcher.groupCount() == 2
                            ? matcher.group(1) + " " + matcher.group(2)
                            : matcher.group(1));
        }
        assertFalse("nothing found by " + pattern, found.isEmpty());
        return found;
    }

    private static Set<String> classNames(String sources) {
        return findAll("\"((?:korvel|android|java)/[\\w/$]+)\"", sources);
    }

    private static String descriptor(Class<?> type) {
        return java.lang.invoke.MethodType.methodType(type).toMethodDescriptorString().substring(2);
    }

    private static void addMembers(Class<?> type, Set<String> members) {
        for (Constructor<?> constructor : type.getDeclaredConstructors()) {
            members.add("<init> " + parameters(constructor) + "V");
        }
        for (Class<?> owner = type; owner != null; owner = owner.getSuperclass()) {
            for (Method method : owner.getDeclaredMethods()) {
                members.add(
                        method.getName()
                                + " "
                                + parameters(method)
                                + descriptor(method.getReturnType()));
            }
            for (Field field : owner.getDeclaredFields()) {
                members.add(field.getName() + " " + descriptor(field.getType()));
            }
        }
        for (Method method : type.getMethods()) {
            members.add(
                    method.getName()
                            + " "
                            + parameters(method)
                            + descriptor(method.getReturnType()));
        }
    }

    private static String parameters(Executable executable) {
        final StringBuilder text = new StringBuilder("(");
        for (Class<?> parameter : executable.getParameterTypes()) {
            text.append(descriptor(parameter));
        }
        return text.append(')').toString();
    }

    @Test
    public void everyClassThatNativeCodeNamesIsThere() throws Exception {
        for (String name : classNames(nativeSources())) {
            assertEquals(name.replace('/', '.'), load(name).getName());
        }
    }

    @Test
    public void everyMemberThatNativeCodeNamesIsInOneOfItsClasses() throws Exception {
        final String sources = nativeSources();
        final Set<String> members = new TreeSet<>();
        for (String name : classNames(sources)) {
            addMembers(load(name), members);
        }
        addMembers(ClassLoader.class, members); // it finds the classes
        for (Class<?> type : kitClasses()) {
            addMembers(type, members); // objects whose class native code asks the object for
        }
        final Set<String> named =
                findAll("\"([\\w<>]+)\",\\s*\"(\\([\\w/;\\[$]*\\)[\\w/;\\[$]+)\"", sources);
        named.addAll(findAll("\"(\\w+)\",\\s*\"(L[\\w/$]+;)\"", sources));
        named.removeAll(members);
        assertTrue("not found: " + named, named.isEmpty());
    }

    private static boolean hasNativeMethods(Class<?> type) {
        return Stream.of(type.getDeclaredMethods())
                .anyMatch(method -> Modifier.isNative(method.getModifiers()));
    }

    @Test
    public void theKeepRulesCoverEveryClassOfTheKitThatNativeCodeNames() throws Exception {
        final String rules = new String(Files.readAllBytes(RULES), StandardCharsets.UTF_8);
        for (String name : classNames(nativeSources())) {
            final String dotted = name.replace('/', '.');
            if (dotted.startsWith("korvel.")) {
                assertTrue(
                        "no rule keeps " + dotted,
                        rules.contains("class " + dotted + " {")
                                || hasNativeMethods(load(name))
                                        && rules.contains("native <methods>;")
                                || dotted.startsWith("korvel.core.")
                                        && rules.contains("class korvel.core.** {"));
            }
        }
        // Every class and member that a rule names exists.
        final Matcher rule =
                Pattern.compile("class (korvel[\\w.$]+) \\{([^}]*)\\}").matcher(rules);
        while (rule.find()) {
            final Set<String> members = new TreeSet<>();
            addMembers(load(rule.group(1)), members);
            final Set<String> names =
                    members.stream()
                            .map(member -> member.substring(0, member.indexOf(' ')))
                            .collect(Collectors.toSet());
            final Matcher member = Pattern.compile("([\\w<>*]+)(?:\\(|;)").matcher(rule.group(2));
            while (member.find()) {
                final String name = member.group(1);
                assertTrue(
                        rule.group(1) + " has no " + name,
                        name.equals("*")
                                || names.contains(name)
                                || name.endsWith("*")
                                        && names.stream()
                                                .anyMatch(
                                                        one ->
                                                                one.startsWith(
                                                                        name.substring(
                                                                                0,
                                                                                name.length()
                                                                                        - 1))));
            }
        }
    }
}
