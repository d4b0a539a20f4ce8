package korvel.talvox.demo;

import org.junit.runner.JUnitCore;
import org.junit.runner.Result;
import org.junit.runner.notification.Failure;

/**
 * Console program: recognises one speech file through the public API. It needs no Android device:
 * {@link DemoSession} runs with the framework's classes on this JVM.
 */
public final class Demo {
    private Demo() {}

    public static void main(String[] arguments) {
        if (arguments.length != 1) {
            System.err.println("usage: Demo FILE.wav|FILE.raw");
            System.exit(2);
        }
        System.setProperty("talvox.demo.file", arguments[0]);
        final Result result = JUnitCore.runClasses(DemoSession.class);
        for (Failure failure : result.getFailures()) {
            System.out.println("demo-java: " + failure.getException());
        }
        System.exit(result.wasSuccessful() ? 0 : 1);
    }
}
