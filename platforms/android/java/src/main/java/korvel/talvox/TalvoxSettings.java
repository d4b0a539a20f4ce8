package korvel.talvox;

import android.os.Bundle;
import java.util.Arrays;
import java.util.Collections;
import java.util.List;
import java.util.Objects;

/**
 * Settings of the engine or of one recognition: those that were set, nothing else. What is not set
 * keeps the engine's value, so an empty object changes nothing. Immutable.
 *
 * <pre>{@code
 * TalvoxSettings settings = TalvoxSettings.builder()
 *         .set(TalvoxSettings.URL, "https://asr.example.org")
 *         .set(TalvoxSettings.UUID, installationId)
 *         .set(TalvoxSettings.LANGUAGE, "en-US")
 *         .build();
 * }</pre>
 *
 * <p>Values out of range are not refused here: the engine replaces them when a recognition is
 * created and logs each replacement.
 */
public final class TalvoxSettings {
    /** Base address of the gateway. */
    public static final SettingKey<String> URL = SettingKey.ofText("url");

    /** Identifier of this installation, 32 characters; sent with every request. */
    public static final SettingKey<String> UUID = SettingKey.ofText("uuid");

    /** Engine-wide override of {@link #ASR_POLICY}. */
    public static final SettingKey<AsrOverride> ASR_OVERRIDE =
            SettingKey.ofChoice("asr", AsrOverride.class);

    /** Whether recognitions by the device are copied to the gateway. */
    public static final SettingKey<LoggingPolicy> LOGGING =
            SettingKey.ofChoice("logging", LoggingPolicy.class);

    /** Whether usage events are collected. */
    public static final SettingKey<EventsLogging> EVENTS_LOGGING =
            SettingKey.ofChoice("eventslogging", EventsLogging.class);

    /** The form in which sound is sent. */
    public static final SettingKey<SoundFormat> SOUND_FORMAT =
            SettingKey.ofChoice("soundformat", SoundFormat.class);

    /** Sample rate of the recording in hertz, 8000 to 44100. */
    public static final SettingKey<Integer> SAMPLE_RATE = SettingKey.ofInteger("samplerate");

    /** Configuration text of the voice activity detector, empty for its defaults. */
    public static final SettingKey<String> VAD = SettingKey.ofText("vad");

    /** How the microphone is opened. */
    public static final SettingKey<SessionMode> SESSION_MODE =
            SettingKey.ofChoice("sessionmode", SessionMode.class);

    /** Send the sound while it is recorded instead of afterwards. */
    public static final SettingKey<Boolean> STREAMING = SettingKey.ofBoolean("streaming");

    /** From here the best hypothesis may be {@link Outcome#ACCEPTED}; 0 to 1. */
    public static final SettingKey<Float> UPPER_CONFIDENCE =
            SettingKey.ofFloat("upperconfidence");

    /** What the best hypothesis must be ahead of the next to be accepted; 0 or more. */
    public static final SettingKey<Float> WINNER_LEAD_CONFIDENCE =
            SettingKey.ofFloat("winnerleadconfidence");

    /** Below it the best hypothesis is {@link Outcome#REJECTED}; 0 to the upper confidence. */
    public static final SettingKey<Float> LOWER_CONFIDENCE =
            SettingKey.ofFloat("lowerconfidence");

    /** Quality of the Speex encoder, 0 to 10. */
    public static final SettingKey<Integer> SPEEX_QUALITY = SettingKey.ofInteger("speexquality");

    /** How much the engine logs, 0 to 10. */
    public static final SettingKey<Integer> VERBOSITY = SettingKey.ofInteger("verbosity");

    /** Language that is spoken, for example "en-US". */
    public static final SettingKey<String> LANGUAGE = SettingKey.ofText("language");

    /** What is spoken about. */
    public static final SettingKey<RecognitionModel> MODEL =
            SettingKey.ofChoice("model", RecognitionModel.class);

    /** Which recogniser to use. */
    public static final SettingKey<AsrPolicy> ASR_POLICY =
            SettingKey.ofChoice("asrpolicy", AsrPolicy.class);

    /** The user's position. */
    public static final SettingKey<LatLon> MY_POSITION = SettingKey.ofPosition("myll");

    /** Centre of the map that the user sees. */
    public static final SettingKey<LatLon> MAP_CENTER = SettingKey.ofPosition("centerll");

    /** The application's identifier of its session. */
    public static final SettingKey<String> SESSION_ID = SettingKey.ofText("sessionid");

    private static final List<SettingKey<?>> KEYS =
            Collections.unmodifiableList(
                    Arrays.<SettingKey<?>>asList(
                            URL,
                            UUID,
                            ASR_OVERRIDE,
                            LOGGING,
                            EVENTS_LOGGING,
                            SOUND_FORMAT,
                            SAMPLE_RATE,
                            VAD,
                            SESSION_MODE,
                            STREAMING,
                            UPPER_CONFIDENCE,
                            WINNER_LEAD_CONFIDENCE,
                            LOWER_CONFIDENCE,
                            SPEEX_QUALITY,
                            VERBOSITY,
                            LANGUAGE,
                            MODEL,
                            ASR_POLICY,
                            MY_POSITION,
                            MAP_CENTER,
                            SESSION_ID));

    private final Bundle values;

    private TalvoxSettings(Bundle values) {
        this.values = values;
    }

    /** All keys there are. */
    public static List<SettingKey<?>> keys() {
        return KEYS;
    }

    public static Builder builder() {
        return new Builder(new Bundle());
    }

    /** A builder that begins with these settings. */
    public Builder toBuilder() {
        return new Builder(new Bundle(values));
    }

    /** Whether the key has been set. */
    public boolean has(SettingKey<?> key) {
        return values.containsKey(key.getName());
    }

    /**
     * The value of the key.
     *
     * @return null if it is not set, or if the engine's XML settings gave it a text that none of the
     *     constants stands for
     */
    public <T> T get(SettingKey<T> key) {
        return has(key) ? key.get(values) : null;
    }

    /** Settings from a bundle as {@link #toBundle} makes it. Other entries stay as they are. */
    public static TalvoxSettings fromBundle(Bundle bundle) {
        return new TalvoxSettings(new Bundle(bundle));
    }

    /**
     * The settings as a bundle: booleans, integers, floats, texts, and locations for positions. It is
     * the caller's own.
     */
    public Bundle toBundle() {
        return new Bundle(values);
    }

    /** Collects settings. Not thread-safe. */
    public static final class Builder {
        private final Bundle values;

        private Builder(Bundle values) {
            this.values = values;
        }

        /**
         * Sets one value in place of any earlier one.
         *
         * @throws NullPointerException if the key or the value is null
         */
        public <T> Builder set(SettingKey<T> key, T value) {
            key.put(values, Objects.requireNonNull(value, key.getName()));
            return this;
        }

        /** Forgets the value of the key, so that the engine's holds. */
        public Builder unset(SettingKey<?> key) {
            values.remove(key.getName());
            return this;
        }

        public TalvoxSettings build() {
            return new TalvoxSettings(new Bundle(values));
        }
    }
}
