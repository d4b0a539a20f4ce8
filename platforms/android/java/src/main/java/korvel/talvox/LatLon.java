package korvel.talvox;

import org.jspecify.annotations.Nullable;

/** A position in degrees, kept in single precision as the engine does. Immutable. */
public final class LatLon {
    private final float latitude;
    private final float longitude;

    /** Takes any values; a builder of settings refuses those that are out of range. */
    public LatLon(double latitude, double longitude) {
        this.latitude = (float) latitude;
        this.longitude = (float) longitude;
    }

    /** In degrees; north is positive. */
    public float getLatitude() {
        return latitude;
    }

    /** In degrees; east is positive. */
    public float getLongitude() {
        return longitude;
    }

    @Override
    public boolean equals(@Nullable Object other) {
        return other instanceof LatLon
                && Float.compare(latitude, ((LatLon) other).latitude) == 0
                && Float.compare(longitude, ((LatLon) other).longitude) == 0;
    }

    @Override
    public int hashCode() {
        return 31 * Float.hashCode(latitude) + Float.hashCode(longitude);
    }

    @Override
    public String toString() {
        return latitude + ", " + longitude;
    }
}
