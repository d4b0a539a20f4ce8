package korvel.core;

import android.content.Context;
import android.hardware.Sensor;
import android.hardware.SensorEvent;
import android.hardware.SensorEventListener;
import android.hardware.SensorManager;
import org.jspecify.annotations.Nullable;

/** The device's proximity sensor for the native library, which makes, starts and stops it. */
final class ProximityBackend implements SensorEventListener {
    private final long source;
    private @Nullable SensorManager manager;

    private ProximityBackend(long source) {
        this.source = source;
    }

    private boolean start() {
        final Context context = CoreApplication.getApplicationContext();
        if (context == null) {
            return false;
        }
        manager = (SensorManager) context.getSystemService(Context.SENSOR_SERVICE);
        final Sensor sensor =
                manager != null ? manager.getDefaultSensor(Sensor.TYPE_PROXIMITY) : null;
        return sensor != null
                && manager.registerListener(this, sensor, SensorManager.SENSOR_DELAY_GAME);
    }

    private void stop() {
        if (manager != null) {
            manager.unregisterListener(this);
        }
    }

    @Override
    public void onSensorChanged(SensorEvent event) {
        // Most sensors tell near and far only, as 0 and their maximum.
        onSampleInternal(source, event.values[0] < event.sensor.getMaximumRange());
    }

    @Override
    public void onAccuracyChanged(Sensor sensor, int accuracy) {}

    private static native void onSampleInternal(long source, boolean near);
}
