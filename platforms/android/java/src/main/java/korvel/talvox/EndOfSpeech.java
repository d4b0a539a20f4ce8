package korvel.talvox;

/**
 * Ready-made values of {@link TalvoxSettings#VAD} for kinds of use. The document ENDPOINTING.md has
 * the measured figures of each. Constants, for any thread.
 */
public final class EndOfSpeech {
    /** For short commands without pauses: a quick end. */
    public static final String COMMAND =
            "individual=45;total=300;overhangmax1=1;overhangmax2=6;"
                    + "analyzems=850;activityoff=.1;analyzemson=300;activityon=.4";

    /** For sentences with pauses between their parts: a late end. */
    public static final String DICTATION =
            "individual=45;total=300;overhangmax1=1;overhangmax2=6;"
                    + "analyzems=1250;activityoff=.1;analyzemson=300;activityon=.4";

    /** For places with clicks, hum or wind: noise seldom begins speech. */
    public static final String NOISY =
            "individual=45;total=300;overhangmax1=1;overhangmax2=6;"
                    + "analyzems=1250;activityoff=.1;analyzemson=300;activityon=.7";

    private EndOfSpeech() {}
}
