package korvel.talvox.bench;

import org.junit.runner.JUnitCore;
import org.junit.runner.Result;
import org.junit.runner.notification.Failure;

/** Console program: what crossing from Java to native code and back costs. */
public final class Bench {
    private Bench() {}

    public static void main(String[] arguments) {
        final Result result = JUnitCore.runClasses(BenchSession.class);
        for (Failure failure : result.getFailures()) {
            System.out.println("bench: " + failure.getException());
        }
        System.exit(result.wasSuccessful() ? 0 : 1);
    }
}
