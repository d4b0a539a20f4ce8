package korvel.talvox;

import org.jspecify.annotations.Nullable;

/** One thing that may have been said. Immutable. */
public final class Hypothesis {
    private static final float UNKNOWN = -1.0f;

    private final String text;
    private final float confidence;

    Hypothesis(String text, float confidence) {
        this.text = text;
        this.confidence = confidence;
    }

    /** What may have been said; not null. */
    public String getText() {
        return text;
    }

    /** As the recognizer gave it, as a rule from 0 to 1; −1 when it gave none. */
    public float getConfidence() {
        return confidence;
    }

    /** Whether the recognizer gave a confidence. */
    public boolean hasConfidence() {
        return confidence != UNKNOWN;
    }

    @Override
    public boolean equals(@Nullable Object other) {
        return other instanceof Hypothesis
                && text.equals(((Hypothesis) other).text)
                && Float.compare(confidence, ((Hypothesis) other).confidence) == 0;
    }

    @Override
    public int hashCode() {
        return 31 * text.hashCode() + Float.hashCode(confidence);
    }

    @Override
    public String toString() {
        return hasConfidence() ? text + " (" + confidence + ")" : text;
    }
}
