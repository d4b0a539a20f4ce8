package korvel.talvox;

/**
 * The engine's verdict on the hypotheses of a recognition, by the confidences that the engine's
 * settings have when the results arrive.
 */
public enum Outcome {
    /**
     * The best hypothesis is below the lower confidence: treat as nothing recognised. Two or more
     * hypotheses, the first of them without a confidence, are always rejected, whatever they are
     * worth: where the device recognizer may serve, look at {@link Hypothesis#hasConfidence}
     * and offer those to the user.
     */
    REJECTED,
    /**
     * The best hypothesis is confident and clearly ahead of the next, or is the only one and has no
     * confidence: use it without asking.
     */
    ACCEPTED,
    /** Anything else, no hypothesis at all included: offer what there is to the user to choose. */
    UNCERTAIN;

    /** The outcome of a native code; {@link #UNCERTAIN} for numbers outside the table. */
    static Outcome fromCode(int code) {
        final Outcome[] all = values();
        return code >= 0 && code < all.length ? all[code] : UNCERTAIN;
    }
}
