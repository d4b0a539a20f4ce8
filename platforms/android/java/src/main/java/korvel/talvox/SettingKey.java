package korvel.talvox;

import android.location.Location;
import android.os.Bundle;
import java.util.Objects;

/**
 * The name of a setting together with the type of its values. The keys are the constants of {@link
 * TalvoxSettings}.
 *
 * @param <T> the type of the values
 */
public abstract class SettingKey<T> {
    /** The provider that the engine's own locations name. */
    private static final String PROVIDER = "Talvox";

    private final String name;

    private SettingKey(String name) {
        this.name = Objects.requireNonNull(name);
    }

    /** The name in the engine's settings, in bundles and in XML. */
    public final String getName() {
        return name;
    }

    @Override
    public final String toString() {
        return name;
    }

    abstract void put(Bundle bundle, T value);

    /** The value in the bundle, which has the key; null if it is of another type. */
    abstract T get(Bundle bundle);

    static SettingKey<Boolean> ofBoolean(String name) {
        return new SettingKey<Boolean>(name) {
            @Override
            void put(Bundle bundle, Boolean value) {
                bundle.putBoolean(getName(), value);
            }

            @Override
            Boolean get(Bundle bundle) {
                return read(bundle, getName(), Boolean.class);
            }
        };
    }

    static SettingKey<Integer> ofInteger(String name) {
        return new SettingKey<Integer>(name) {
            @Override
            void put(Bundle bundle, Integer value) {
                bundle.putInt(getName(), value);
            }

            @Override
            Integer get(Bundle bundle) {
                return read(bundle, getName(), Integer.class);
            }
        };
    }

    static SettingKey<Float> ofFloat(String name) {
        return new SettingKey<Float>(name) {
            @Override
            void put(Bundle bundle, Float value) {
                bundle.putFloat(getName(), value);
            }

            @Override
            Float get(Bundle bundle) {
                return read(bundle, getName(), Float.class);
            }
        };
    }

    static SettingKey<String> ofText(String name) {
        return new SettingKey<String>(name) {
            @Override
            void put(Bundle bundle, String value) {
                bundle.putString(getName(), value);
            }

            @Override
            String get(Bundle bundle) {
                return read(bundle, getName(), String.class);
            }
        };
    }

    static <E extends Enum<E> & SettingValue> SettingKey<E> ofChoice(
            String name, Class<E> values) {
        return new SettingKey<E>(name) {
            @Override
            void put(Bundle bundle, E value) {
                bundle.putString(getName(), value.getText());
            }

            @Override
            E get(Bundle bundle) {
                final String text = read(bundle, getName(), String.class);
                for (E value : values.getEnumConstants()) {
                    if (value.getText().equals(text)) {
                        return value;
                    }
                }
                return null;
            }
        };
    }

    static SettingKey<LatLon> ofPosition(String name) {
        return new SettingKey<LatLon>(name) {
            @Override
            void put(Bundle bundle, LatLon value) {
                final Location location = new Location(PROVIDER);
                location.setLatitude(value.getLatitude());
                location.setLongitude(value.getLongitude());
                bundle.putParcelable(getName(), location);
            }

            @Override
            LatLon get(Bundle bundle) {
                final Location location = read(bundle, getName(), Location.class);
                return location == null
                        ? null
                        : new LatLon(location.getLatitude(), location.getLongitude());
            }
        };
    }

    @SuppressWarnings("deprecation") // the typed forms of Bundle.get are younger than API 24
    private static <V> V read(Bundle bundle, String name, Class<V> type) {
        final Object value = bundle.get(name);
        return type.isInstance(value) ? type.cast(value) : null;
    }
}
