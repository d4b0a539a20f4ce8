package korvel.talvox.support;

import static org.junit.Assert.assertTrue;

import java.lang.reflect.Constructor;
import java.lang.reflect.Executable;
import java.lang.reflect.InvocationTargetException;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.lang.reflect.Parameter;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.HashMap;
import java.util.List;
import java.util.Map;
import java.util.stream.Collectors;
import java.util.stream.Stream;
import org.jspecify.annotations.Nullable;

/** Calls public methods and constructors with one null after the other, and collects the faults. */
public final class NullArguments {
    private final Map<Class<?>, Object> samples = new HashMap<>();
    private final List<String> faults = new ArrayList<>();
    private int calls;

    public NullArguments() {
        addSample(String.class, "text");
        addSample(Object.class, "text");
        addSample(boolean.class, false);
        addSample(int.class, 1);
        addSample(long.class, 1L << 20);
        addSample(float.class, 0f);
        addSample(double.class, 0.0);
    }

    /** A value for the arguments of this type, and the object whose methods are called. */
    public void addSample(Class<?> type, Object value) {
        samples.put(type, value);
    }

    /** One line for each argument that is null, and not refused by its name. */
    public List<String> getFaults() {
        return faults;
    }

    /** How many calls were made. */
    public int getCalls() {
        return calls;
    }

    /** Calls what a public class offers. */
    public void checkCallsOf(Class<?> type) throws Exception {
        for (Executable call : findCalls(type).collect(Collectors.toList())) {
            checkEachArgument(call);
        }
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
            final Class<?> type = parameters[index].getType();
            final boolean mayBeNull =
                    call.getAnnotatedParameterTypes()[index].isAnnotationPresent(Nullable.class);
            if (!type.isPrimitive() && !mayBeNull) {
                assertTrue("compiled without names: " + call, parameters[index].isNamePresent());
                check(call, index, null);
            }
            if (call.isVarArgs() && type == String[].class) {
                check(call, index, new String[] {"text", null});
            }
        }
    }

    private void check(Executable call, int index, Object bad) throws Exception {
        final Object[] arguments = new Object[call.getParameterCount()];
        for (int other = 0; other < arguments.length; other++) {
            arguments[other] = other == index ? bad : sample(call.getParameterTypes()[other]);
        }
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
}
