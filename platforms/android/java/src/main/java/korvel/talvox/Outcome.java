package korvel.talvox;

/** The engine's verdict on the hypotheses of a recognition. */
public enum Outcome {
    /** The best hypothesis is below the lower confidence: treat as nothing recognised. */
    REJECTED,
    /** The best hypothesis is confident and clearly ahead of the next: use it without asking. */
    ACCEPTED,
    /** Anything else: offer the hypotheses to the user to choose. */
    UNCERTAIN;

    /** The outcome of a native code; {@link #UNCERTAIN} for numbers outside the table. */
    static Outcome fromCode(int code) {
        final Outcome[] all = values();
        return code >= 0 && code < all.length ? all[code] : UNCERTAIN;
    }
}
