/**
 * An engine for applications' own tests. Start with {@link korvel.talvox.testing.FakeEngine}.
 *
 * <p>Nothing is null unless it is annotated so. An argument that must not be null and is, throws a
 * {@code NullPointerException} at once.
 */
@NullMarked
package korvel.talvox.testing;

import org.jspecify.annotations.NullMarked;
