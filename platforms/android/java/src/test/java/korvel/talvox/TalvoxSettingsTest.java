package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
import java.util.Arrays;
import java.util.HashSet;
import java.util.Set;
import java.util.stream.Collectors;
import korvel.talvox.impl.SettingsProbe;
import korvel.talvox.support.KitTest;
import org.junit.Test;

public class TalvoxSettingsTest extends KitTest {
    @Test
    public void holdsWhatWasSetAndNothingElse() {
        final TalvoxSettings settings =
                TalvoxSettings.builder()
                        .set(TalvoxSettings.STREAMING, true)
                        .set(TalvoxSettings.SAMPLE_RATE, 8000)
                        .set(TalvoxSettings.UPPER_CONFIDENCE, 0.75f)
                        .set(TalvoxSettings.LANGUAGE, "en-US")
                        .set(TalvoxSettings.SOUND_FORMAT, SoundFormat.SPEEX)
                        .set(TalvoxSettings.MY_POSITION, new LatLon(10.5, 20.25))
                        .build();
        assertEquals(true, settings.get(TalvoxSettings.STREAMING));
        assertEquals(8000, (int) settings.get(TalvoxSettings.SAMPLE_RATE));
        assertEquals(0.75f, settings.get(TalvoxSettings.UPPER_CONFIDENCE), 0);
        assertEquals("en-US", settings.get(TalvoxSettings.LANGUAGE));
        assertEquals(SoundFormat.SPEEX, settings.get(TalvoxSettings.SOUND_FORMAT));
        assertEquals(new LatLon(10.5, 20.25), settings.get(TalvoxSettings.MY_POSITION));
        assertNull(settings.get(TalvoxSettings.URL));
        assertFalse(settings.has(TalvoxSettings.URL));
        assertEquals(6, settings.toBundle().size());
    }

    @Test
    public void cannotBeChangedFromOutside() {
        final TalvoxSettings.Builder builder =
                TalvoxSettings.builder().set(TalvoxSettings.URL, "http://one");
        final TalvoxSettings settings = builder.build();
        builder.set(TalvoxSettings.URL, "http://two");
        settings.toBundle().clear();
        final Bundle bundle = settings.toBundle();
        final TalvoxSettings copy = TalvoxSettings.fromBundle(bundle);
        bundle.putString("url", "http://three");
        settings.toBuilder().unset(TalvoxSettings.URL);
        assertEquals("http://one", settings.get(TalvoxSettings.URL));
        assertEquals("http://one", copy.get(TalvoxSettings.URL));
    }

    @Test
    public void aBuilderFromSettingsBeginsWithThem() {
        final TalvoxSettings settings =
                TalvoxSettings.builder()
                        .set(TalvoxSettings.URL, "http://one")
                        .set(TalvoxSettings.VERBOSITY, 2)
                        .build();
        final TalvoxSettings changed =
                settings.toBuilder().unset(TalvoxSettings.VERBOSITY).build();
        assertEquals("http://one", changed.get(TalvoxSettings.URL));
        assertFalse(changed.has(TalvoxSettings.VERBOSITY));
        assertTrue(settings.has(TalvoxSettings.VERBOSITY));
    }

    @Test
    public void refusesNullAndNamesTheKey() {
        final NullPointerException refusal =
                assertThrows(
                        NullPointerException.class,
                        () -> TalvoxSettings.builder().set(TalvoxSettings.UUID, null));
        assertEquals("value of uuid", refusal.getMessage());
    }

    @Test
    public void aTextOutsideTheConstantsAndAForeignTypeReadAsNull() {
        final Bundle bundle = new Bundle();
        bundle.putString("asr", "sometimes");
        bundle.putString("samplerate", "16000");
        final TalvoxSettings settings = TalvoxSettings.fromBundle(bundle);
        assertTrue(settings.has(TalvoxSettings.ASR_OVERRIDE));
        assertNull(settings.get(TalvoxSettings.ASR_OVERRIDE));
        assertNull(settings.get(TalvoxSettings.SAMPLE_RATE));
    }

    private static Set<String> namesOfKeys(boolean areEngineOnly) {
        return TalvoxSettings.keys().stream()
                .filter(key -> key.isEngineOnly() == areEngineOnly)
                .map(SettingKey::getName)
                .collect(Collectors.toSet());
    }

    @Test
    public void aKeyHasTheLevelThatNativeCodeGivesIt() {
        assertEquals(
                new HashSet<>(Arrays.asList(SettingsProbe.engineKeys())), namesOfKeys(true));
        assertEquals(
                new HashSet<>(Arrays.asList(SettingsProbe.recognitionKeys())),
                namesOfKeys(false));
    }

    private static <T> void setAsItIs(
            TalvoxSettings.Builder builder, SettingKey<T> key, TalvoxSettings values) {
        builder.set(key, values.get(key));
    }

    @Test
    public void aBuilderForRecognitionsRefusesExactlyTheKeysOfTheEngine() {
        final TalvoxSettings values = everything();
        for (SettingKey<?> key : TalvoxSettings.keys()) {
            setAsItIs(TalvoxSettings.builder(), key, values);
            if (key.isEngineOnly()) {
                assertEquals(
                        key
                                + ": of the engine only, without effect on one recognition;"
                                + " set it with TalvoxEngine.updateSettings",
                        assertThrows(
                                        IllegalArgumentException.class,
                                        () ->
                                                setAsItIs(
                                                        TalvoxSettings.forRecognition(),
                                                        key,
                                                        values))
                                .getMessage());
            } else {
                setAsItIs(TalvoxSettings.forRecognition(), key, values);
            }
        }
    }

    /** Every key with a good value. */
    static TalvoxSettings everything() {
        final TalvoxSettings settings =
                TalvoxSettings.builder()
                        .set(TalvoxSettings.URL, "http://one")
                        .set(TalvoxSettings.UUID, "0123456789abcdef0123456789abcdef")
                        .set(TalvoxSettings.ASR_OVERRIDE, AsrOverride.DISABLED)
                        .set(TalvoxSettings.LOGGING, LoggingPolicy.WITHOUT_SOUND_ALWAYS)
                        .set(TalvoxSettings.EVENTS_LOGGING, EventsLogging.ENABLED)
                        .set(TalvoxSettings.SOUND_FORMAT, SoundFormat.SPEEX)
                        .set(TalvoxSettings.SAMPLE_RATE, 8000)
                        .set(TalvoxSettings.VAD, "activityon=0.5")
                        .set(TalvoxSettings.SESSION_MODE, SessionMode.GENERAL)
                        .set(TalvoxSettings.STREAMING, true)
                        .set(TalvoxSettings.UPPER_CONFIDENCE, 0.8f)
                        .set(TalvoxSettings.WINNER_LEAD_CONFIDENCE, 0.1f)
                        .set(TalvoxSettings.LOWER_CONFIDENCE, 0.3f)
                        .set(TalvoxSettings.SPEEX_QUALITY, 4)
                        .set(TalvoxSettings.VERBOSITY, 1)
                        .set(TalvoxSettings.LANGUAGE, "tr-TR")
                        .set(TalvoxSettings.MODEL, RecognitionModel.MAPS)
                        .set(TalvoxSettings.ASR_POLICY, AsrPolicy.PLATFORM_FIRST)
                        .set(TalvoxSettings.MY_POSITION, new LatLon(1, 2))
                        .set(TalvoxSettings.MAP_CENTER, new LatLon(3, 4))
                        .set(TalvoxSettings.SESSION_ID, "s1")
                        .build();
        assertEquals(TalvoxSettings.keys().size(), settings.toBundle().size());
        return settings;
    }
}
