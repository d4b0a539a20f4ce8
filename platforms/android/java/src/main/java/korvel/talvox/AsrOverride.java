package korvel.talvox;

/** The engine-wide override of every {@link AsrPolicy}. See {@link TalvoxSettings#ASR_OVERRIDE}. */
public enum AsrOverride implements SettingValue {
    /** No override. */
    DEFAULT("default"),
    /** The gateway, unless the policy is disabled. */
    KORVEL_ONLY_IF_ENABLED("korvel_only_if_enabled"),
    /** The gateway, always. */
    KORVEL_ONLY_EVERYWHERE("korvel_only_everywhere"),
    /** The device's, unless the policy is disabled. */
    PLATFORM_ONLY_IF_ENABLED("platform_only_if_enabled"),
    /** The device's, always. */
    PLATFORM_ONLY_EVERYWHERE("platform_only_everywhere"),
    /** The device's or the gateway, unless the policy is disabled. */
    PLATFORM_FIRST_IF_ENABLED("platform_first_if_enabled"),
    /** The device's or else the gateway, always. */
    PLATFORM_FIRST_EVERYWHERE("platform_first_everywhere"),
    /** No recognition at all. */
    DISABLED("disabled");

    private final String text;

    AsrOverride(String text) {
        this.text = text;
    }

    @Override
    public String getText() {
        return text;
    }
}
