package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import android.content.Context;
import android.os.Bundle;
import java.io.File;
import java.lang.reflect.Constructor;
import java.lang.reflect.Executable;
import java.lang.reflect.InvocationTargetException;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.lang.reflect.Parameter;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Collections;
import java.util.HashMap;
import java.util.List;
import java.util.Map;
import java.util.concurrent.Executor;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import korvel.talvox.RecognitionListener;
import korvel.talvox.SettingKey;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.proximity.ProximityGestureRecognizer;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.support.PublicApi;
import korvel.talvox.util.UsageLog;
import org.jspecify.annotations.Nullable;
import org.junit.Before;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/**
 * Every argument of the public API that must not be null is refused when it is, by its name: each
 * public method and constructor is called with one null after the other.
 */
public class NullArgumentsTest extends EngineTestCase {
    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    private final Map<Class<?>, Object> samples = new HashMap<>();
    private final List<String> faults = new ArrayList<>();
    private int calls;

    @Before
    public void makeSamples() {
        final TalvoxSettings settings = TalvoxSettings.forRecognition().build();
        samples.put(Context.class, application);
        samples.put(Bundle.class, new Bundle());
        samples.put(File.class, folder.getRoot());
        samples.put(String.class, "text");
        samples.put(Object.class, "text");
        samples.put(Executor.class, (Executor) Runnable::run);
        samples.put(RecognitionListener.class, new Events());
        samples.put(SettingKey.class, TalvoxSettings.LANGUAGE);
        samples.put(TalvoxSettings.class, settings);
        samples.put(TalvoxSettings.Builder.class, settings.toBuilder());
        samples.put(TalvoxEngine.class, engine);
        samples.put(
                ProximityGestureRecognizer.Listener.class,
                (ProximityGestureRecognizer.Listener) gesture -> {});
        samples.put(boolean.class, false);
        samples.put(int.class, 1);
        samples.put(long.class, 1L << 20);
        samples.put(float.class, 0f);
        samples.put(double.class, 0.0);
    }

    /** Not what applications implement, and not what the compiler adds. */
    private static Stream<Executable> findCalls(Class<?> type) {
        if (type.isInterface()) {
            return Stream.empty();
        }
        return Stream.concat(
                        Arrays.stream(type.getDeclaredMethods()),
                        Arrays.stream(type.getDeclaredConstructors()))
                .filter(call -> Modifier.isPublic(call.getModifiers()))
                .filter(call -> !call.isSynthetic())
                .filter(call -> !(type.isEnum() && call.getName().equals("valueOf")));
    }

    private void checkEachArgument(Executable call) throws Exception {
        final Parameter[] parameters = call.getParameters();
        for (int index = 0; index < parameters.length; index++) {
            final boolean mayBeNull =
                    call.getAnnotatedParameterTypes()[index].isAnnotationPresent(Nullable.class);
            if (!parameters[index].getType().isPrimitive() && !mayBeNull) {
                assertTrue("compiled without names: " + call, parameters[index].isNamePresent());
                check(call, index);
            }
        }
    }

    private void check(Executable call, int index) throws Exception {
        final Object[] arguments =
                Arrays.stream(call.getParameterTypes()).map(this::sample).toArray();
        arguments[index] = null;
        calls++;
        final String name = call.getParameters()[index].getName();
        try {
            invoke(call, arguments);
            faults.add(call + ": takes null as " + name);
        } catch (InvocationTargetException thrown) {
            final Throwable refusal = thrown.getCause();
            final String message = String.valueOf(refusal.getMessage());
            if (!(refusal instanceof NullPointerException)
                    || !(message.equals(name) || message.startsWith(name + " "))) {
                faults.add(call + ": null as " + name + " throws " + refusal);
            }
        }
    }

    private Object sample(Class<?> type) {
        final Object value = samples.get(type);
        assertTrue("no value for " + type, value != null);
        return value;
    }

    private void invoke(Executable call, Object[] arguments) throws Exception {
        if (call instanceof Constructor) {
            ((Constructor<?>) call).newInstance(arguments);
        } else if (Modifier.isStatic(call.getModifiers())) {
            ((Method) call).invoke(null, arguments);
        } else {
            ((Method) call).invoke(sample(call.getDeclaringClass()), arguments);
        }
    }

    @Test
    public void nullIsRefusedByName() throws Exception {
        try (UsageLog log = UsageLog.open("nulls");
                ProximityGestureRecognizer gestures =
                        new ProximityGestureRecognizer(gesture -> {}, Runnable::run)) {
            samples.put(UsageLog.class, log);
            samples.put(ProximityGestureRecognizer.class, gestures);
            for (Class<?> type : PublicApi.findClasses()) {
                for (Executable call : findCalls(type).collect(Collectors.toList())) {
                    checkEachArgument(call);
                }
            }
        }
        assertEquals(Collections.emptyList(), faults);
        assertTrue("only " + calls + " calls", calls >= 30);
    }
}
