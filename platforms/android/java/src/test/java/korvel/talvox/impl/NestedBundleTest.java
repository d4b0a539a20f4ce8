package korvel.talvox.impl;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertTrue;

import android.location.Location;
import android.os.Bundle;
import java.nio.charset.StandardCharsets;
import java.util.Arrays;
import java.util.HashSet;
import java.util.Set;
import korvel.talvox.support.EngineTestCase;
import org.junit.Test;

/** What becomes of bundles within bundles on their way into native code and back. */
public class NestedBundleTest extends EngineTestCase {
    private static final Set<String> LEAVES =
            new HashSet<>(Arrays.asList("flag", "count", "ratio", "place", "sometitle"));
    private static final int DEPTH = 50;

    private static Bundle nest(Bundle inner) {
        final Bundle outer = new Bundle();
        outer.putBundle("inner", inner);
        return outer;
    }

    private static Bundle with(String key, String value) {
        final Bundle bundle = new Bundle();
        bundle.putString(key, value);
        return bundle;
    }

    private static Bundle middleOf(Bundle tree) {
        return tree.getBundle("inner");
    }

    private static Bundle lowestOf(Bundle tree) {
        return middleOf(tree).getBundle("inner");
    }

    private static void assertLevel(
            Bundle level, boolean flag, int count, float ratio, double latitude, String title) {
        assertEquals(flag, level.get("flag"));
        assertEquals(count, level.get("count"));
        assertEquals(ratio, level.get("ratio"));
        final Location place = (Location) level.get("place");
        assertEquals("Talvox", place.getProvider());
        assertEquals(latitude, place.getLatitude(), 0);
        assertEquals(20.25, place.getLongitude(), 0);
        assertEquals(title, level.get("sometitle"));
    }

    private static void assertBase(Bundle level, int count, String title) {
        assertLevel(level, true, count, 0.5f, 10.5, title);
    }

    private static Bundle makeLevel() {
        final Bundle level = new Bundle();
        level.putBoolean("flag", false);
        level.putInt("count", -7);
        level.putFloat("ratio", 0.25f);
        final Location place = new Location("gps");
        place.setLatitude(-33.5);
        place.setLongitude(20.25);
        level.putParcelable("place", place);
        level.putString("sometitle", "new");
        return level;
    }

    private static void assertNew(Bundle level) {
        assertLevel(level, false, -7, 0.25f, -33.5, "new");
    }

    @Test
    public void everyTypeOfEveryLevelArrivesInJava() {
        final Bundle base = BundleProbe.makeBase();
        assertBase(base, 1, "top");
        assertBase(middleOf(base), 2, "middle");
        assertBase(lowestOf(base), 3, "lowest");
        assertEquals(LEAVES, lowestOf(base).keySet());
    }

    @Test
    public void everyTypeOfEveryLevelArrivesInNativeCode() {
        final Bundle update = makeLevel();
        final Bundle middle = makeLevel();
        middle.putBundle("inner", makeLevel());
        update.putBundle("inner", middle);
        final Bundle result = BundleProbe.update(update);
        assertNew(result);
        assertNew(middleOf(result));
        assertNew(lowestOf(result));
    }

    @Test
    public void theNativeTreeIsOfTheTypesOfTheTable() {
        final String level =
                "<count>-7</count>\n<flag>false</flag>\n%s<place>-33.5,20.25</place>\n"
                        + "<ratio>0.25</ratio>\n<sometitle>new</sometitle>\n";
        final Bundle update = makeLevel();
        update.putBundle("inner", makeLevel());
        assertEquals(
                "<tree>\n"
                        + String.format(
                                level, "<inner>\n" + String.format(level, "") + "</inner>\n")
                        + "</tree>\n",
                BundleProbe.updateNothing(update));
    }

    @Test
    public void nestedValuesThatAreNotNamedAreKept() {
        final Bundle result = BundleProbe.update(nest(nest(with("sometitle", "other"))));
        assertBase(result, 1, "top");
        assertBase(middleOf(result), 2, "middle");
        assertBase(lowestOf(result), 3, "other");
    }

    @Test
    public void anEmptyNestedBundleChangesNothing() {
        final Bundle result = BundleProbe.update(nest(new Bundle()));
        assertBase(middleOf(result), 2, "middle");
        assertBase(lowestOf(result), 3, "lowest");
    }

    @Test
    public void whatIsSharedIsNeverChanged() {
        final String base = BundleProbe.getBaseAfter(new Bundle());
        assertTrue(base, base.contains("<sometitle>lowest</sometitle>"));
        final Bundle update = makeLevel();
        update.putBundle("inner", nest(makeLevel()));
        assertEquals(base, BundleProbe.getBaseAfter(update));
    }

    @Test
    public void onlyTheNestedBundlesThatAreNamedAreCopied() {
        assertEquals(2, BundleProbe.countShared(makeLevel()));
        assertEquals(1, BundleProbe.countShared(nest(with("sometitle", "x"))));
        assertEquals(0, BundleProbe.countShared(nest(nest(with("sometitle", "x")))));
    }

    @Test
    public void keysOfEveryLevelMayBeSpelledOtherwise() {
        final Bundle lowest = with("Some_Title", "other");
        lowest.putInt("C-O-U-N-T", 30);
        final Bundle middle = new Bundle();
        middle.putBundle("In ner", lowest);
        final Bundle update = new Bundle();
        update.putBundle("IN_NER", middle);
        final Bundle result = lowestOf(BundleProbe.update(update));
        assertBase(result, 30, "other");
        assertEquals(LEAVES, result.keySet());
    }

    @Test
    public void unknownNestedKeysAreLoggedAndTheOthersTaken() {
        final Bundle inner = with("Col_our", "red");
        inner.putString("ключ\uD83D\uDE00", "x");
        inner.putString(null, "x");
        inner.putBundle("branch", with("sometitle", "not looked at"));
        inner.putInt("count", 20);
        final Bundle result = BundleProbe.update(nest(inner));
        assertLogged("jBundleToBundle: unknown field name colour, ingoring");
        assertLogged("jBundleToBundle: unknown field name ключ\uD83D\uDE00, ingoring");
        assertLogged("jBundleToBundle: unknown field name , ingoring");
        assertLogged("jBundleToBundle: unknown field name branch, ingoring");
        assertBase(middleOf(result), 20, "middle");
        assertEquals(6, middleOf(result).size());
        assertBase(result, 1, "top");
    }

    @Test
    public void valuesOfTheWrongTypeAreLoggedAndChangeNothing() {
        final Bundle inner = new Bundle();
        inner.putInt("flag", 0);
        inner.putLong("count", 9);
        inner.putDouble("ratio", 0.25);
        inner.putString("place", "1,2");
        inner.putBundle("sometitle", new Bundle());
        inner.putString("inner", "<sometitle>x</sometitle>");
        final Bundle result = BundleProbe.update(nest(inner));
        for (String key : middleOf(result).keySet()) {
            assertLogged("jBundleToBundle: wrong value type for field " + key + ", ignoring");
        }
        assertBase(middleOf(result), 2, "middle");
        assertBase(lowestOf(result), 3, "lowest");
    }

    @Test
    public void nullValuesAreLoggedAndChangeNothing() {
        final Bundle inner = with("sometitle", null);
        inner.putParcelable("place", null);
        inner.putBundle("inner", null);
        final Bundle result = BundleProbe.update(nest(inner));
        assertLogged("jBundleToBundle: null value for field sometitle, ignoring");
        assertLogged("jBundleToBundle: null value for field place, ignoring");
        assertLogged("jBundleToBundle: null value for field inner, ignoring");
        assertBase(middleOf(result), 2, "middle");
        assertBase(lowestOf(result), 3, "lowest");
    }

    @Test
    public void aTypeThatIsUnknownIsLoggedInBothDirections() {
        final Bundle inner = with("odd", "x");
        inner.putInt("count", 20);
        assertBase(middleOf(BundleProbe.update(nest(inner))), 20, "middle");
        final String line = "jBundleToBundle: unknown elem type for field odd: 42, ignoring";
        assertEquals(1, log().split(line, -1).length - 1);
        final Bundle made = middleOf(BundleProbe.makeNested(new byte[0]));
        assertFalse(made.containsKey("odd"));
        assertEquals(2, log().split(line, -1).length - 1);
    }

    @Test
    public void withoutATableEveryKeyIsUnknown() {
        assertEquals("<tree>\n</tree>\n", BundleProbe.updateWithoutTable(nest(new Bundle())));
        assertLogged("jBundleToBundle: unknown field name inner, ingoring");
    }

    @Test
    public void aNullNestedBundleArrivesAsAnEmptyOne() {
        final Bundle made = middleOf(BundleProbe.makeNested(new byte[0]));
        assertEquals("", made.get("sometitle"));
        assertTrue(made.getBundle("inner").isEmpty());
    }

    @Test
    public void nestedTextOfEveryKindArrivesUnchanged() {
        final String[] texts = {
            "", "на восток", "a\0b", "\uD83D\uDE00 and \uD834\uDD1E", "\u0080\u07FF\u0800\uFFFF"
        };
        for (String text : texts) {
            final Bundle result = BundleProbe.update(nest(nest(with("sometitle", text))));
            assertEquals(text, lowestOf(result).get("sometitle"));
            final byte[] bytes = text.getBytes(StandardCharsets.UTF_8);
            assertEquals(text, middleOf(BundleProbe.makeNested(bytes)).get("sometitle"));
        }
    }

    @Test
    public void nestedTextThatIsInvalidBecomesTheReplacementCharacter() {
        final Bundle result = BundleProbe.update(nest(with("sometitle", "a\uD83Db\uDE00")));
        assertEquals("a\uFFFDb\uFFFD", middleOf(result).get("sometitle"));
        final byte[] bytes = {'a', (byte) 0xFF, 'b', (byte) 0xC3, 0, (byte) 0x80};
        assertEquals(
                "a\uFFFDb\uFFFD\0\uFFFD",
                middleOf(BundleProbe.makeNested(bytes)).get("sometitle"));
    }

    @Test
    public void manyLevelsArrive() {
        Bundle update = with("sometitle", "deep");
        for (int level = 0; level < DEPTH; level++) {
            update = nest(update);
        }
        Bundle result = BundleProbe.update(update);
        for (int level = 0; level < DEPTH; level++) {
            result = result.getBundle("inner");
        }
        assertEquals("deep", result.get("sometitle"));
    }
}
