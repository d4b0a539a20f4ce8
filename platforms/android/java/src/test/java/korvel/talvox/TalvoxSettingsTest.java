package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
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
        assertEquals("uuid", refusal.getMessage());
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
}
