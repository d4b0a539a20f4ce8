package korvel.talvox.proximity;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;
import static org.robolectric.Shadows.shadowOf;

import android.hardware.Sensor;
import android.hardware.SensorManager;
import java.util.concurrent.BlockingQueue;
import java.util.concurrent.LinkedBlockingQueue;
import java.util.concurrent.TimeUnit;
import korvel.talvox.support.EngineTestCase;
import org.junit.After;
import org.junit.Before;
import org.junit.Test;
import org.robolectric.shadows.SensorEventBuilder;
import org.robolectric.shadows.ShadowSensor;

public class ProximityGestureRecognizerTest extends EngineTestCase {
    private final BlockingQueue<String> gestures = new LinkedBlockingQueue<>();
    private SensorManager sensors;
    private Sensor sensor;
    private ProximityGestureRecognizer recognizer;

    @Before
    public void open() {
        sensors = application.getSystemService(SensorManager.class);
        sensor = ShadowSensor.newInstance(Sensor.TYPE_PROXIMITY);
        shadowOf(sensor).setMaximumRange(5);
        shadowOf(sensors).addSensor(sensor);
        recognizer = new ProximityGestureRecognizer(gestures::add);
    }

    @After
    public void close() {
        recognizer.close();
    }

    private void sense(float distance) {
        onMain(
                () ->
                        shadowOf(sensors)
                                .sendSensorEventToListeners(
                                        SensorEventBuilder.newBuilder()
                                                .setSensor(sensor)
                                                .setValues(new float[] {distance})
                                                .build()));
    }

    private String next() throws InterruptedException {
        final String gesture = gestures.poll(PATIENCE_S, TimeUnit.SECONDS);
        assertNotNull("no gesture came", gesture);
        return gesture;
    }

    @Test
    public void reportsAGestureByItsName() throws Exception {
        recognizer.addGesture("волна", "near:0-60000");
        recognizer.addGesture("never", "near:0-60000 far:0-60000 near:59000-60000");
        recognizer.start();
        sense(5);
        sense(0);
        sense(5);
        assertEquals("волна", next());
        assertTrue(gestures.isEmpty());
    }

    @Test
    public void reportsNothingWhileItIsStopped() throws Exception {
        recognizer.addGesture("wave", "near:0-60000");
        recognizer.start();
        recognizer.stop();
        sense(0);
        sense(5);
        drainMain();
        assertTrue(gestures.isEmpty());
        recognizer.start();
        sense(0);
        sense(5);
        assertEquals("wave", next());
    }

    @Test
    public void refusesAPatternThatIsNotUnderstood() {
        final IllegalArgumentException refusal =
                assertThrows(
                        IllegalArgumentException.class,
                        () -> recognizer.addGesture("wave", "near:500-50"));
        assertNotNull(refusal.getMessage());
        assertThrows(IllegalArgumentException.class, () -> recognizer.addGesture("wave", ""));
        assertThrows(
                IllegalArgumentException.class, () -> recognizer.addGesture("", "near:50-500"));
    }

    @Test
    public void refusesNullAndUseAfterItsEnd() {
        assertThrows(NullPointerException.class, () -> recognizer.addGesture(null, "near:1-2"));
        assertThrows(NullPointerException.class, () -> recognizer.addGesture("wave", null));
        assertThrows(NullPointerException.class, () -> new ProximityGestureRecognizer(null));
        recognizer.close();
        recognizer.close();
        assertThrows(IllegalStateException.class, recognizer::start);
        assertThrows(IllegalStateException.class, recognizer::stop);
        assertThrows(
                IllegalStateException.class, () -> recognizer.addGesture("wave", "near:1-2"));
    }

    @Test
    public void mayBeClosedFromInsideAGesture() throws Exception {
        try (ProximityGestureRecognizer direct =
                new ProximityGestureRecognizer(
                        gesture -> {
                            recognizer.close();
                            gestures.add(gesture);
                        },
                        Runnable::run)) {
            recognizer.close();
            recognizer = direct;
            direct.addGesture("wave", "near:0-60000");
            direct.start();
            sense(0);
            sense(5);
            assertEquals("wave", next());
            sense(0);
            sense(5);
            assertTrue(gestures.isEmpty());
        }
    }
}
