package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;

import android.location.Location;
import android.os.Bundle;
import korvel.talvox.impl.Talvox;
import korvel.talvox.support.EngineTestCase;
import org.junit.Test;

/** What becomes of a bundle on its way into the native settings and back. */
public class BundleConversionTest extends EngineTestCase {
    private static Bundle afterUpdate(Bundle update) {
        Talvox.updateSettings(Talvox.getHandle(), update);
        return Talvox.getSettings(Talvox.getHandle());
    }

    private static Bundle with(String key, String value) {
        final Bundle bundle = new Bundle();
        bundle.putString(key, value);
        return bundle;
    }

    @Test
    public void carriesEveryTypeBothWays() {
        final Bundle update = new Bundle();
        update.putBoolean("streaming", true);
        update.putInt("samplerate", 44100);
        update.putFloat("upperconfidence", 0.8125f);
        update.putString("sessionid", "s1");
        final Location location = new Location("gps");
        location.setLatitude(10.5);
        location.setLongitude(20.25);
        update.putParcelable("myll", location);
        final Bundle result = afterUpdate(update);
        assertEquals(true, result.get("streaming"));
        assertEquals(44100, result.get("samplerate"));
        assertEquals(0.8125f, result.get("upperconfidence"));
        assertEquals("s1", result.get("sessionid"));
        final Location position = (Location) result.get("myll");
        assertEquals("Talvox", position.getProvider());
        assertEquals(10.5, position.getLatitude(), 0);
        assertEquals(20.25, position.getLongitude(), 0);
    }

    @Test
    public void negativeAndExtremeNumbersArrive() {
        final Bundle update = new Bundle();
        update.putInt("samplerate", Integer.MIN_VALUE);
        update.putInt("verbosity", Integer.MAX_VALUE);
        update.putFloat("upperconfidence", -Float.MAX_VALUE);
        update.putFloat("lowerconfidence", Float.NaN);
        final Bundle result = afterUpdate(update);
        assertEquals(Integer.MIN_VALUE, result.get("samplerate"));
        assertEquals(Integer.MAX_VALUE, result.get("verbosity"));
        assertEquals(-Float.MAX_VALUE, result.get("upperconfidence"));
        assertEquals(Float.NaN, result.get("lowerconfidence"));
    }

    @Test
    public void keepsWhatTheBundleDoesNotName() {
        final Bundle before = Talvox.getSettings(Talvox.getHandle());
        final Bundle result = afterUpdate(new Bundle());
        assertEquals(before.keySet(), result.keySet());
        assertEquals(16000, result.get("samplerate"));
        assertEquals("ru-RU", result.get("language"));
    }

    @Test
    public void acceptsKeysInOtherSpellings() {
        final Bundle update = new Bundle();
        update.putInt("Sample_Rate", 8000);
        update.putInt("SPEEX-quality", 3);
        update.putString("session id", "s2");
        final Bundle result = afterUpdate(update);
        assertEquals(8000, result.get("samplerate"));
        assertEquals(3, result.get("speexquality"));
        assertEquals("s2", result.get("sessionid"));
        assertEquals(21, result.size());
    }

    @Test
    public void skipsAnUnknownKeyWithOneLineAndTakesTheOthers() {
        final Bundle update = new Bundle();
        update.putString("colour", "red");
        update.putInt("samplerate", 11025);
        update.putString("uuid", UUID);
        final Bundle result = afterUpdate(update);
        assertLogged("jBundleToBundle: unknown field name colour, ingoring");
        assertEquals(11025, result.get("samplerate"));
        assertEquals(UUID, result.get("uuid"));
        assertFalse(result.containsKey("colour"));
    }

    @Test
    public void keepsTheOldValueWhereTheTypeIsWrong() {
        final Bundle update = with("samplerate", "8000");
        update.putInt("language", 7);
        update.putBoolean("upperconfidence", true);
        update.putDouble("lowerconfidence", 0.1);
        update.putString("myll", "10,20");
        update.putInt("streaming", 1);
        final Bundle result = afterUpdate(update);
        assertEquals(16000, result.get("samplerate"));
        assertEquals("ru-RU", result.get("language"));
        assertEquals(0.9f, result.get("upperconfidence"));
        assertEquals(0.4f, result.get("lowerconfidence"));
        assertEquals(0.0, ((Location) result.get("myll")).getLatitude(), 0);
        assertEquals(false, result.get("streaming"));
        assertLogged("jBundleToBundle: wrong value type for field samplerate, ignoring");
    }

    @Test
    public void keepsTheOldValueWhereTheValueIsNull() {
        final Bundle update = with("language", null);
        update.putParcelable("myll", null);
        assertEquals("ru-RU", afterUpdate(update).get("language"));
        assertLogged("jBundleToBundle: null value for field language, ignoring");
        assertLogged("jBundleToBundle: null value for field myll, ignoring");
    }

    @Test
    public void textOfEveryKindArrivesUnchanged() {
        final String[] texts = {
            "",
            "на восток",
            "a\0b",
            "\uD83D\uDE00 and \uD834\uDD1E",
            "\u0080\u07FF\u0800\uFFFF",
            "%s %n \"<&>\""
        };
        for (String text : texts) {
            assertEquals(text, afterUpdate(with("sessionid", text)).get("sessionid"));
        }
    }

    @Test
    public void halfOfAPairBecomesTheReplacementCharacter() {
        assertEquals("a\uFFFDb", afterUpdate(with("sessionid", "a\uD83Db")).get("sessionid"));
        assertEquals("\uFFFD", afterUpdate(with("sessionid", "\uDE00")).get("sessionid"));
    }

    @Test
    public void anUnknownKeyOfAnyTextIsLogged() {
        afterUpdate(with("ключ\uD83D\uDE00", "x"));
        assertLogged("jBundleToBundle: unknown field name ключ\uD83D\uDE00, ingoring");
    }

    @Test
    public void aLongTextArrives() {
        final StringBuilder text = new StringBuilder();
        for (int i = 0; i < 100_000; i++) {
            text.append((char) ('a' + i % 26));
        }
        assertEquals(
                text.toString(), afterUpdate(with("sessionid", text.toString())).get("sessionid"));
    }
}
