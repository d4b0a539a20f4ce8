package korvel.talvox;

import android.os.Bundle;
import java.util.Arrays;
import java.util.Collections;
import java.util.HashMap;
import java.util.List;
import java.util.Map;
import java.util.Objects;
import org.jspecify.annotations.Nullable;

/**
 * Settings of the engine or of one recognition: those that were set, nothing else. What is not set
 * keeps the engine's value, so an empty object changes nothing. Immutable.
 *
 * <pre>{@code
 * engine.updateSettings(TalvoxSettings.builder()
 *         .set(TalvoxSettings.URL, "https://asr.example.org")
 *         .set(TalvoxSettings.UUID, installationId)
 *         .set(TalvoxSettings.LANGUAGE, "en-US")
 *         .build());
 * recognizer = engine.createRecognizer(
 *         TalvoxSettings.forRecognition().set(TalvoxSettings.LANGUAGE, "tr-TR").build(), listener);
 * }</pre>
 *
 * <table>
 *   <caption>Where a setting counts</caption>
 *   <tr><th>keys</th><th>set on the engine</th><th>set for one recognition</th></tr>
 *   <tr><td>{@link #URL}, {@link #UUID}, {@link #SOUND_FORMAT}, {@link #SPEEX_QUALITY},
 *       {@link #SAMPLE_RATE}, {@link #VAD}, {@link #SESSION_MODE}, {@link #STREAMING},
 *       {@link #UPPER_CONFIDENCE}, {@link #WINNER_LEAD_CONFIDENCE}, {@link #LOWER_CONFIDENCE},
 *       {@link #EVENTS_LOGGING}</td>
 *       <td>for everything</td><td>refused</td></tr>
 *   <tr><td>{@link #LANGUAGE}, {@link #MODEL}, {@link #ASR_POLICY}, {@link #ASR_OVERRIDE},
 *       {@link #LOGGING}, {@link #MY_POSITION}, {@link #MAP_CENTER}, {@link #SESSION_ID}</td>
 *       <td>for the recognitions that set no value of their own</td>
 *       <td>for that recognition</td></tr>
 *   <tr><td>{@link #VERBOSITY}</td>
 *       <td>what the engine logs</td><td>whether the settings of that recognition are logged</td>
 *       </tr>
 * </table>
 *
 * <p>A builder refuses a value that is out of range with an {@code IllegalArgumentException}. Three
 * things it does not check: the text of {@link #VAD}, the language (any text that is not empty),
 * and a lower confidence against an upper one that is set elsewhere. Settings from a bundle ({@link
 * #fromBundle}) and from XML are not checked at all. The engine uses its own settings as they are;
 * it repairs only the copy that each recognition gets when it starts, with a line in the log for
 * each repair.
 */
public final class TalvoxSettings {
    private static final SettingKey.Level ENGINE = SettingKey.Level.ENGINE;
    private static final SettingKey.Level BOTH = SettingKey.Level.ENGINE_AND_RECOGNITION;

    /**
     * Base address of the gateway: http or https, without a user name, a blank or a "#". Of the
     * engine only.
     */
    public static final SettingKey<String> URL =
            SettingKey.ofText("url", ENGINE, SettingChecks::address);

    /**
     * Identifier of this installation, 32 bytes without a blank or a "#"; sent with every request.
     * Of the engine only.
     */
    public static final SettingKey<String> UUID =
            SettingKey.ofText("uuid", ENGINE, SettingChecks::uuid);

    /** Override of {@link #ASR_POLICY}, meant for all recognitions of the application. */
    public static final SettingKey<AsrOverride> ASR_OVERRIDE =
            SettingKey.ofChoice("asr", BOTH, AsrOverride.values());

    /** Whether recognitions by the device are copied to the gateway. */
    public static final SettingKey<LoggingPolicy> LOGGING =
            SettingKey.ofChoice("logging", BOTH, LoggingPolicy.values());

    /**
     * Whether usage events are collected. Set on the engine, it switches the collector on or off as
     * {@link korvel.talvox.util.LogCollector#setLoggingEnabled} does; the later of the two decides.
     * {@link TalvoxEngine#getSettings} says how the collector is switched. Of the engine only.
     */
    public static final SettingKey<EventsLogging> EVENTS_LOGGING =
            SettingKey.ofChoice("eventslogging", ENGINE, EventsLogging.values());

    /**
     * The form in which sound is sent, also that of recognitions by the device which are copied to
     * the gateway. Of the engine only.
     */
    public static final SettingKey<SoundFormat> SOUND_FORMAT =
            SettingKey.ofChoice("soundformat", ENGINE, SoundFormat.values());

    /** Sample rate of the recording in hertz, 8000 to 44100. Of the engine only. */
    public static final SettingKey<Integer> SAMPLE_RATE =
            SettingKey.ofInteger("samplerate", ENGINE, SettingChecks.range(8000, 44100));

    /**
     * Configuration text of the voice activity detector, empty for its defaults, or one of {@link
     * EndOfSpeech}. Of the engine only.
     */
    public static final SettingKey<String> VAD =
            SettingKey.ofText("vad", ENGINE, SettingChecks.none());

    /** How the microphone is opened. Of the engine only. */
    public static final SettingKey<SessionMode> SESSION_MODE =
            SettingKey.ofChoice("sessionmode", ENGINE, SessionMode.values());

    /** Send the sound while it is recorded instead of afterwards. Of the engine only. */
    public static final SettingKey<Boolean> STREAMING =
            SettingKey.ofBoolean("streaming", ENGINE, SettingChecks.none());

    /**
     * From here the best hypothesis may be {@link Outcome#ACCEPTED}; 0 to 1. Of the engine only,
     * read when the results arrive.
     */
    public static final SettingKey<Float> UPPER_CONFIDENCE =
            SettingKey.ofFloat("upperconfidence", ENGINE, SettingChecks.range(0f, 1f));

    /**
     * How far the best hypothesis must be ahead of the next to be accepted; 0 or more. Of the engine
     * only, read when the results arrive.
     */
    public static final SettingKey<Float> WINNER_LEAD_CONFIDENCE =
            SettingKey.ofFloat("winnerleadconfidence", ENGINE, SettingChecks.notNegative());

    /**
     * Below it the best hypothesis is {@link Outcome#REJECTED}; 0 to the upper confidence. Of the
     * engine only, read when the results arrive.
     */
    public static final SettingKey<Float> LOWER_CONFIDENCE =
            SettingKey.ofFloat("lowerconfidence", ENGINE, SettingChecks.range(0f, 1f));

    /** Quality of the Speex encoder, 0 to 10. Of the engine only, like {@link #SOUND_FORMAT}. */
    public static final SettingKey<Integer> SPEEX_QUALITY =
            SettingKey.ofInteger("speexquality", ENGINE, SettingChecks.range(0, 10));

    /**
     * How much the engine logs, 0 to 10; from 1 on also all settings of each recognition that
     * starts, from 2 on also the progress of its request. Set for one recognition, it decides only
     * whether the settings of that one are logged.
     */
    public static final SettingKey<Integer> VERBOSITY =
            SettingKey.ofInteger("verbosity", BOTH, SettingChecks.range(0, 10));

    /** Language that is spoken, for example "en-US"; not empty. "ru-RU" where it is never set. */
    public static final SettingKey<String> LANGUAGE =
            SettingKey.ofText("language", BOTH, SettingChecks::notEmpty);

    /** What is spoken about. */
    public static final SettingKey<RecognitionModel> MODEL =
            SettingKey.ofChoice("model", BOTH, RecognitionModel.values());

    /** Which recognizer to use. */
    public static final SettingKey<AsrPolicy> ASR_POLICY =
            SettingKey.ofChoice("asrpolicy", BOTH, AsrPolicy.values());

    /** The user's position: latitude from -90 to 90, longitude from -180 to 180. */
    public static final SettingKey<LatLon> MY_POSITION = SettingKey.ofPosition("myll", BOTH);

    /** Centre of the map that the user sees; the ranges of {@link #MY_POSITION}. */
    public static final SettingKey<LatLon> MAP_CENTER = SettingKey.ofPosition("centerll", BOTH);

    /**
     * The application's identifier of its session; becomes part of the request's address, so it
     * holds neither blanks nor control characters nor "#".
     */
    public static final SettingKey<String> SESSION_ID =
            SettingKey.ofText("sessionid", BOTH, SettingChecks::partOfAddress);

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

    private final Values values;

    private TalvoxSettings(Values values) {
        this.values = values;
    }

    /** All keys there are. */
    public static List<SettingKey<?>> keys() {
        return KEYS;
    }

    /** A builder that takes all keys, for {@link TalvoxEngine#updateSettings}. */
    public static Builder builder() {
        return new Builder(new Values(), false);
    }

    /**
     * A builder for {@link TalvoxEngine#createRecognizer(TalvoxSettings, RecognitionListener)}: it
     * refuses the keys that are of the engine only.
     */
    public static Builder forRecognition() {
        return new Builder(new Values(), true);
    }

    /** A builder that begins with these settings and takes all keys. */
    public Builder toBuilder() {
        return new Builder(new Values(values), false);
    }

    /** Whether the key has been set. */
    public boolean has(SettingKey<?> key) {
        return values.has(Objects.requireNonNull(key, "key"));
    }

    /**
     * The value of the key.
     *
     * @return null if it is not set, or if the engine's XML settings gave it a text that none of the
     *     constants stands for
     */
    public <T> @Nullable T get(SettingKey<T> key) {
        return values.get(Objects.requireNonNull(key, "key"));
    }

    /**
     * Settings from a bundle as {@link #toBundle} makes it. The values are not checked, and other
     * entries stay as they are.
     */
    public static TalvoxSettings fromBundle(Bundle bundle) {
        return new TalvoxSettings(new Values(Objects.requireNonNull(bundle, "bundle")));
    }

    /**
     * The settings as a bundle: booleans, integers, floats, texts, and locations for positions. It is
     * the caller's own.
     */
    public Bundle toBundle() {
        return values.toBundle();
    }

    /**
     * The values, by their keys. Android's classes come in only with a bundle, so that the test kit
     * works where there are none.
     */
    private static final class Values {
        private final Map<SettingKey<?>, Object> byKey = new HashMap<>();

        /** Holds what has no value above; null without such a bundle. */
        private final @Nullable Bundle received;

        Values() {
            received = null;
        }

        Values(Values other) {
            byKey.putAll(other.byKey);
            received = other.received == null ? null : new Bundle(other.received);
        }

        Values(Bundle received) {
            this.received = new Bundle(received);
        }

        boolean has(SettingKey<?> key) {
            return byKey.containsKey(key)
                    || received != null && received.containsKey(key.getName());
        }

        @SuppressWarnings("unchecked") // set() puts only values of the key's type
        <T> @Nullable T get(SettingKey<T> key) {
            if (byKey.containsKey(key)) {
                return (T) byKey.get(key);
            }
            return received == null ? null : key.get(received);
        }

        <T> void set(SettingKey<T> key, T value) {
            byKey.put(key, value);
        }

        void unset(SettingKey<?> key) {
            byKey.remove(key);
            if (received != null) {
                received.remove(key.getName());
            }
        }

        Bundle toBundle() {
            final Bundle bundle = received == null ? new Bundle() : new Bundle(received);
            for (SettingKey<?> key : byKey.keySet()) {
                put(bundle, key);
            }
            return bundle;
        }

        private <T> void put(Bundle bundle, SettingKey<T> key) {
            final T value = get(key);
            if (value != null) {
                key.put(bundle, value);
            }
        }
    }

    /**
     * Checks that one recognition may have these settings.
     *
     * @throws IllegalArgumentException with the names of the keys that are of the engine only
     */
    void checkForRecognition() {
        final StringBuilder refused = new StringBuilder();
        for (SettingKey<?> key : KEYS) {
            if (key.isEngineOnly() && has(key)) {
                refused.append(refused.length() == 0 ? "" : ", ").append(key);
            }
        }
        if (refused.length() > 0) {
            throw new IllegalArgumentException(notForRecognition(refused.toString()));
        }
    }

    private static String notForRecognition(String keys) {
        return keys
                + ": of the engine only, without effect on one recognition;"
                + " set it with TalvoxEngine.updateSettings";
    }

    /** Collects settings. Not thread-safe. */
    public static final class Builder {
        private final Values values;
        private final boolean isForRecognition;

        private Builder(Values values, boolean isForRecognition) {
            this.values = values;
            this.isForRecognition = isForRecognition;
        }

        /**
         * Sets one value in place of any earlier one.
         *
         * @throws NullPointerException if the key or the value is null; the message names the key
         * @throws IllegalArgumentException if the value is out of range, or if the key is of the
         *     engine only and these are settings {@linkplain #forRecognition for a recognition}
         */
        public <T> Builder set(SettingKey<T> key, T value) {
            Objects.requireNonNull(key, "key");
            Objects.requireNonNull(value, () -> "value of " + key);
            if (isForRecognition && key.isEngineOnly()) {
                throw new IllegalArgumentException(notForRecognition(key.getName()));
            }
            key.check(value);
            values.set(key, value);
            return this;
        }

        /** Forgets the value of the key, so that the engine's holds. */
        public Builder unset(SettingKey<?> key) {
            values.unset(Objects.requireNonNull(key, "key"));
            return this;
        }

        /**
         * The settings collected so far.
         *
         * @throws IllegalArgumentException if both confidences are set, the lower above the upper
         */
        public TalvoxSettings build() {
            final TalvoxSettings settings = new TalvoxSettings(new Values(values));
            final Float lower = settings.get(LOWER_CONFIDENCE);
            final Float upper = settings.get(UPPER_CONFIDENCE);
            if (lower != null && upper != null && lower > upper) {
                throw new IllegalArgumentException(
                        LOWER_CONFIDENCE
                                + " must not be above "
                                + UPPER_CONFIDENCE
                                + ": "
                                + lower
                                + " and "
                                + upper);
            }
            return settings;
        }
    }
}
