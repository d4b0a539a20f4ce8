package korvel.talvox;

import android.location.Location;
import android.os.Bundle;
import java.util.Objects;
import org.jspecify.annotations.Nullable;

/**
 * The name of a setting together with the type of its values. The keys are the constants of {@link
 * TalvoxSettings}. Immutable.
 *
 * @param <T> the type of the values
 */
public abstract class SettingKey<T> {
    /** Where a setting may be set. */
    enum Level {
        ENGINE,
        ENGINE_AND_RECOGNITION
    }

    /** The provider that the engine's own locations name. */
    private static final String PROVIDER = "Talvox";

    private final String name;
    private final Level level;
    private final SettingChecks.Check<T> check;

    private SettingKey(String name, Level level, SettingChecks.Check<T> check) {
        this.name = Objects.requireNonNull(name);
        this.level = level;
        this.check = check;
    }

    /** The name in the engine's settings, in bundles and in XML. */
    public final String getName() {
        return name;
    }

    /**
     * Whether the setting is the engine's alone. One recognition cannot have a value of its own
     * then: it uses the engine's.
     */
    public final boolean isEngineOnly() {
        return level == Level.ENGINE;
    }

    @Override
    public final String toString() {
        return name;
    }

    /** Throws an IllegalArgumentException if the value, which is not null, is not a good one. */
    final void check(T value) {
        final String fault = check.findFault(value);
        if (fault != null) {
            throw new IllegalArgumentException(name + " " + fault);
        }
    }

    abstract void put(Bundle bundle, T value);

    /** The value in the bundle; null if it is not there or of another type. */
    abstract @Nullable T get(Bundle bundle);

    static SettingKey<Boolean> ofBoolean(
            String name, Level level, SettingChecks.Check<Boolean> check) {
        return ofType(name, level, check, Boolean.class, Bundle::putBoolean);
    }

    static SettingKey<Integer> ofInteger(
            String name, Level level, SettingChecks.Check<Integer> check) {
        return ofType(name, level, check, Integer.class, Bundle::putInt);
    }

    static SettingKey<Float> ofFloat(
            String name, Level level, SettingChecks.Check<Float> check) {
        return ofType(name, level, check, Float.class, Bundle::putFloat);
    }

    static SettingKey<String> ofText(
            String name, Level level, SettingChecks.Check<String> check) {
        return ofType(name, level, check, String.class, Bundle::putString);
    }

    static <E extends Enum<E> & SettingValue> SettingKey<E> ofChoice(
            String name, Level level, E[] values) {
        return new SettingKey<E>(name, level, SettingChecks.none()) {
            @Override
            void put(Bundle bundle, E value) {
                bundle.putString(getName(), value.getText());
            }

            @Override
            @Nullable E get(Bundle bundle) {
                final String text = read(bundle, getName(), String.class);
                for (E value : values) {
                    if (value.getText().equals(text)) {
                        return value;
                    }
                }
                return null;
            }
        };
    }

    static SettingKey<LatLon> ofPosition(String name, Level level) {
        return new SettingKey<LatLon>(name, level, SettingChecks::position) {
            @Override
            void put(Bundle bundle, LatLon value) {
                final Location location = new Location(PROVIDER);
                location.setLatitude(value.getLatitude());
                location.setLongitude(value.getLongitude());
                bundle.putParcelable(getName(), location);
            }

            @Override
            @Nullable LatLon get(Bundle bundle) {
                final Location location = read(bundle, getName(), Location.class);
                return location == null
                        ? null
                        : new LatLon(location.getLatitude(), location.getLongitude());
            }
        };
    }

    /** Puts a value of a type that bundles know. */
    private interface Writer<V> {
        void put(Bundle bundle, String name, V value);
    }

    private static <V> SettingKey<V> ofType(
            String name,
            Level level,
            SettingChecks.Check<V> check,
            Class<V> type,
            Writer<V> writer) {
        return new SettingKey<V>(name, level, check) {
            @Override
            void put(Bundle bundle, V value) {
                writer.put(bundle, getName(), value);
            }

            @Override
            @Nullable V get(Bundle bundle) {
                return read(bundle, getName(), type);
            }
        };
    }

    @SuppressWarnings("deprecation") // the typed forms of Bundle.get are younger than API 24
    private static <V> @Nullable V read(Bundle bundle, String name, Class<V> type) {
        final Object value = bundle.get(name);
        return type.isInstance(value) ? type.cast(value) : null;
    }
}
