package korvel.talvox;

import java.util.ArrayList;
import java.util.Collections;
import java.util.List;
import org.jspecify.annotations.Nullable;

/** What was recognised. Immutable. */
public final class Recognition {
    private final Outcome outcome;
    private final List<Hypothesis> hypotheses;
    private final String requestId;

    Recognition(Outcome outcome, List<Hypothesis> hypotheses, String requestId) {
        this.outcome = outcome;
        this.hypotheses = Collections.unmodifiableList(hypotheses);
        this.requestId = requestId;
    }

    static Recognition fromNative(
            int outcome, String[] texts, float[] confidences, String requestId) {
        final List<Hypothesis> hypotheses = new ArrayList<>(texts.length);
        for (int i = 0; i < texts.length; i++) {
            hypotheses.add(new Hypothesis(texts[i], confidences[i]));
        }
        return new Recognition(Outcome.fromCode(outcome), hypotheses, requestId);
    }

    /**
     * The engine's verdict. Without confidences it says little: one hypothesis is then accepted, two
     * or more are always rejected.
     */
    public Outcome getOutcome() {
        return outcome;
    }

    /** Best first; empty when nothing was recognised. Cannot be modified. */
    public List<Hypothesis> getHypotheses() {
        return hypotheses;
    }

    /**
     * The gateway's identifier of the request; empty if its answer had none, or if the device
     * recognizer served.
     */
    public String getRequestId() {
        return requestId;
    }

    @Override
    public boolean equals(@Nullable Object other) {
        if (!(other instanceof Recognition)) {
            return false;
        }
        final Recognition that = (Recognition) other;
        return outcome == that.outcome
                && hypotheses.equals(that.hypotheses)
                && requestId.equals(that.requestId);
    }

    @Override
    public int hashCode() {
        return 31 * (31 * outcome.hashCode() + hypotheses.hashCode()) + requestId.hashCode();
    }

    @Override
    public String toString() {
        return outcome + " " + hypotheses + (requestId.isEmpty() ? "" : " of " + requestId);
    }
}
