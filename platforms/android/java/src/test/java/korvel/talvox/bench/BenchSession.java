package korvel.talvox.bench;

import android.os.Bundle;
import android.speech.RecognitionListener;
import java.util.concurrent.atomic.AtomicInteger;
import korvel.talvox.AsrPolicy;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.impl.Talvox;
import korvel.talvox.support.DeviceRecognizer;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import org.junit.Assert;
import org.junit.Test;

/** The measurements; the framework's classes are those of a JVM, slower than a device's. */
public class BenchSession extends EngineTestCase {
    private static final int WARM_UP = 3000;
    private static final int CALLS = 10000;

    private static void measure(String name, Runnable call) {
        for (int i = 0; i < WARM_UP; i++) {
            call.run();
        }
        final long begin = System.nanoTime();
        for (int i = 0; i < CALLS; i++) {
            call.run();
        }
        System.out.printf(
                "%-58s %8.2f us%n", name, (System.nanoTime() - begin) / 1e3 / CALLS);
    }

    @Test
    public void conversions() {
        final long handle = Talvox.getHandle();
        final Bundle full = Talvox.getSettings(handle);
        final int keys = full.size();
        measure("baseline: a copy of the bundle in Java", () -> new Bundle(full).size());
        measure("baseline: a native call without arguments", Talvox::getHandle);
        measure(
                "bundle of " + keys + " settings to native",
                () -> Talvox.updateSettings(handle, full));
        measure("native settings to a bundle of " + keys, () -> Talvox.getSettings(handle));
    }

    @Test
    public void events() {
        DeviceRecognizer.install(application);
        final AtomicInteger heard = new AtomicInteger();
        final Events counter =
                new Events() {
                    @Override
                    public void onPowerChanged(float level) {
                        heard.incrementAndGet();
                    }
                };
        final TalvoxSettings onDevice =
                TalvoxSettings.builder()
                        .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_ONLY)
                        .build();
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(onDevice, counter, Runnable::run)) {
            recognizer.start();
            final RecognitionListener device = DeviceRecognizer.getListener();
            onMain(() -> measure("a level from Java to native and to a listener in Java",
                    () -> device.onRmsChanged(1)));
        }
        Assert.assertEquals(WARM_UP + CALLS, heard.get());
    }
}
