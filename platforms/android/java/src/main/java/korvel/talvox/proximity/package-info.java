/**
 * Gestures in front of the proximity sensor.
 *
 * <p>Nothing is null unless it is annotated so. An argument that must not be null and is, throws a
 * {@code NullPointerException} at once.
 */
@NullMarked
package korvel.talvox.proximity;

import org.jspecify.annotations.NullMarked;
