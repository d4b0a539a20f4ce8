/**
 * The usage log.
 *
 * <p>Nothing is null unless it is annotated so. An argument that must not be null and is, throws a
 * {@code NullPointerException} at once.
 */
@NullMarked
package korvel.talvox.util;

import org.jspecify.annotations.NullMarked;
