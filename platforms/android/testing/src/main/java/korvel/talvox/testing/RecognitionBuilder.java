package korvel.talvox.testing;

import java.util.ArrayList;
import java.util.List;
import java.util.Objects;
import korvel.talvox.Hypothesis;
import korvel.talvox.Outcome;
import korvel.talvox.Recognition;
import korvel.talvox.TestKitAccess;

/**
 * Builds a {@link Recognition} with a verdict of the test's choice, as far as the engine could reach
 * it: the verdict depends on the thresholds in the engine's settings, except in the three cases that
 * {@link #build} checks. Not thread-safe.
 */
public final class RecognitionBuilder {
    private final Outcome outcome;
    private final List<Hypothesis> hypotheses = new ArrayList<>();
    private String requestId = "";

    /**
     * Begins a recognition without hypotheses.
     *
     * @param outcome the engine's verdict
     */
    public RecognitionBuilder(Outcome outcome) {
        this.outcome = Objects.requireNonNull(outcome, "outcome");
    }

    /** An accepted recognition of one hypothesis with full confidence. */
    public static Recognition accepted(String text) {
        return new RecognitionBuilder(Outcome.ACCEPTED).hypothesis(text, 1).build();
    }

    /** What the engine reports if nothing was recognised: no hypotheses, uncertain. */
    public static Recognition empty() {
        return new RecognitionBuilder(Outcome.UNCERTAIN).build();
    }

    /** Adds a hypothesis after those that were added before. */
    public RecognitionBuilder hypothesis(Hypothesis hypothesis) {
        hypotheses.add(Objects.requireNonNull(hypothesis, "hypothesis"));
        return this;
    }

    /**
     * Adds a hypothesis.
     *
     * @param confidence from 0 to 1
     * @throws IllegalArgumentException if it is outside that range
     */
    public RecognitionBuilder hypothesis(String text, float confidence) {
        return hypothesis(new HypothesisBuilder(text).confidence(confidence).build());
    }

    /** Sets the gateway's identifier of the request, empty unless set. */
    public RecognitionBuilder requestId(String value) {
        requestId = Objects.requireNonNull(value, "value");
        return this;
    }

    /**
     * The recognition.
     *
     * @throws IllegalArgumentException if the engine reaches another verdict on these hypotheses
     *     whatever its settings: without hypotheses it is uncertain; one without a confidence is
     *     accepted; several, the first without a confidence, are rejected
     */
    public Recognition build() {
        if (hypotheses.isEmpty()) {
            require(Outcome.UNCERTAIN, "without hypotheses");
        } else if (!hypotheses.get(0).hasConfidence()) {
            if (hypotheses.size() == 1) {
                require(Outcome.ACCEPTED, "on one hypothesis without a confidence");
            } else {
                require(Outcome.REJECTED, "on several hypotheses, the first without a confidence,");
            }
        }
        return TestKitAccess.makeRecognition(outcome, new ArrayList<>(hypotheses), requestId);
    }

    private void require(Outcome only, String condition) {
        if (outcome != only) {
            throw new IllegalArgumentException(
                    "the verdict " + condition + " is " + only + ", not " + outcome);
        }
    }
}
