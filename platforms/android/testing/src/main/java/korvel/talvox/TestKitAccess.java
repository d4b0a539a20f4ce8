package korvel.talvox;

import java.util.List;
import korvel.talvox.impl.EngineBackend;
import org.jspecify.annotations.NullMarked;
import org.jspecify.annotations.Nullable;

/** What the test kit needs of the kit's package-private parts. For korvel.talvox.testing alone. */
@NullMarked
public final class TestKitAccess {
    private TestKitAccess() {}

    public static TalvoxEngine makeEngine(EngineBackend backend) {
        return new TalvoxEngine(backend);
    }

    /** From now on {@link TalvoxEngine#getInstance} returns this engine; null for the native one. */
    public static void substitute(@Nullable TalvoxEngine engine) {
        TalvoxEngine.substitute(engine);
    }

    public static Hypothesis makeHypothesis(String text, float confidence) {
        return new Hypothesis(text, confidence);
    }

    public static Recognition makeRecognition(
            Outcome outcome, List<Hypothesis> hypotheses, String requestId) {
        return new Recognition(outcome, hypotheses, requestId);
    }

    public static ErrorDetail makeErrorDetail(
            String reason,
            @Nullable Integer httpStatus,
            @Nullable Integer deviceError,
            @Nullable RecorderState recorderState) {
        return new ErrorDetail(reason, httpStatus, deviceError, recorderState);
    }
}
