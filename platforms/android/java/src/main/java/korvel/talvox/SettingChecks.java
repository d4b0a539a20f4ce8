package korvel.talvox;

import java.nio.charset.StandardCharsets;
import java.util.Locale;
import org.jspecify.annotations.Nullable;

/** What a value of a setting must be. Each check returns its complaint, or null for a good value. */
final class SettingChecks {
    private static final int UUID_BYTES = 32;
    private static final int HIGHEST_PORT = 65535;

    private SettingChecks() {}

    /** Checks a value. */
    interface Check<T> {
        /** What is wrong, to follow the key's name; null if nothing is. */
        @Nullable String findFault(T value);
    }

    static <T> Check<T> none() {
        return value -> null;
    }

    static Check<Integer> range(int lowest, int highest) {
        return value ->
                value >= lowest && value <= highest
                        ? null
                        : "must be from " + lowest + " to " + highest + ", not " + value;
    }

    /** Refuses NaN as well: no comparison with it holds. */
    static Check<Float> range(float lowest, float highest) {
        return value ->
                value >= lowest && value <= highest
                        ? null
                        : "must be from " + lowest + " to " + highest + ", not " + value;
    }

    static Check<Float> notNegative() {
        return value ->
                value >= 0 && value <= Float.MAX_VALUE
                        ? null
                        : "must be a number of 0 or more, not " + value;
    }

    static @Nullable String position(LatLon value) {
        return Math.abs(value.getLatitude()) <= 90 && Math.abs(value.getLongitude()) <= 180
                ? null
                : "must be from -90 to 90 and from -180 to 180 degrees, not " + value;
    }

    static @Nullable String notEmpty(String value) {
        return value.isEmpty() ? "must not be empty" : null;
    }

    static @Nullable String uuid(String value) {
        final int size = value.getBytes(StandardCharsets.UTF_8).length;
        return size == UUID_BYTES
                ? partOfAddress(value)
                : "must have " + UUID_BYTES + " bytes, not the " + size + " of " + quote(value);
    }

    /** A text that is appended to an address. Not all that ends it: no request would be sent. */
    static @Nullable String partOfAddress(String value) {
        return value.chars().anyMatch(c -> isBlankOrControl(c) || c == '#')
                ? "must hold neither blanks nor control characters nor #: " + quote(value)
                : null;
    }

    /** The network layer's own conditions for an address, and a port that exists. */
    static @Nullable String address(String value) {
        final String fault = partOfAddress(value);
        if (fault != null) {
            return fault;
        }
        final String lower = value.toLowerCase(Locale.ROOT);
        if (!lower.startsWith("http://") && !lower.startsWith("https://")) {
            return "must begin with http:// or https://, not be " + quote(value);
        }
        final String authority = value.substring(value.indexOf("//") + 2).split("[/?]", 2)[0];
        if (authority.indexOf('@') >= 0) {
            return "must not name a user: " + quote(value);
        }
        // The colons of an IPv6 address are inside brackets.
        final int colon = authority.indexOf(':', authority.lastIndexOf(']') + 1);
        final String host = colon < 0 ? authority : authority.substring(0, colon);
        if (host.isEmpty()) {
            return "must name a host: " + quote(value);
        }
        return colon < 0 || isPort(authority.substring(colon + 1))
                ? null
                : "must have a port from 1 to " + HIGHEST_PORT + ": " + quote(value);
    }

    private static boolean isPort(String text) {
        try {
            final int port = Integer.parseInt(text);
            return port >= 1 && port <= HIGHEST_PORT;
        } catch (NumberFormatException notANumber) {
            return false;
        }
    }

    private static boolean isBlankOrControl(int c) {
        return c <= ' ' || c == 0x7F;
    }

    private static String quote(String value) {
        return '"' + value + '"';
    }
}
