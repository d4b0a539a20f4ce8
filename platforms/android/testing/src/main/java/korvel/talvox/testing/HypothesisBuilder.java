package korvel.talvox.testing;

import java.util.Objects;
import korvel.talvox.Hypothesis;
import korvel.talvox.TestKitAccess;

/** Builds a {@link Hypothesis}, without a confidence unless one is set. Not thread-safe. */
public final class HypothesisBuilder {
    private static final float UNKNOWN = -1.0f;

    private final String text;
    private float confidence = UNKNOWN;

    /**
     * Begins a hypothesis.
     *
     * @param text what may have been said
     */
    public HypothesisBuilder(String text) {
        this.text = Objects.requireNonNull(text, "text");
    }

    /**
     * Sets the confidence.
     *
     * @param value from 0 to 1
     * @throws IllegalArgumentException if it is outside that range
     */
    public HypothesisBuilder confidence(float value) {
        if (!(value >= 0 && value <= 1)) {
            throw new IllegalArgumentException("confidence must be from 0 to 1, not " + value);
        }
        confidence = value;
        return this;
    }

    /** The hypothesis. */
    public Hypothesis build() {
        return TestKitAccess.makeHypothesis(text, confidence);
    }
}
