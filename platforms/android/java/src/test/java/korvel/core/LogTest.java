package korvel.core;

import static org.junit.Assert.assertEquals;

import java.util.List;
import java.util.stream.Collectors;
import korvel.talvox.impl.Talvox;
import korvel.talvox.support.EngineTestCase;
import org.junit.Test;
import org.robolectric.shadows.ShadowLog;

/** Messages of native code are entries of Android's log. */
public class LogTest extends EngineTestCase {
    private static List<String> entries() {
        return ShadowLog.getLogsForTag(LogBackend.TAG).stream()
                .map(entry -> entry.msg)
                .collect(Collectors.toList());
    }

    private static String repeat(String text, int count) {
        final StringBuilder all = new StringBuilder();
        for (int index = 0; index < count; index++) {
            all.append(text);
        }
        return all.toString();
    }

    /** A key that the settings do not know is logged with its name. */
    private static void logKey(String key) {
        final android.os.Bundle bundle = new android.os.Bundle();
        bundle.putInt(key, 1);
        Talvox.isRecognitionAvailable(Talvox.getHandle(), bundle);
    }

    @Test
    public void anyTextArrives() {
        CoreApplication.install(application);
        ShadowLog.clear();
        logKey("ключ😀");
        assertEquals("jBundleToBundle: unknown field name ключ😀, ingoring", entries().get(0));
    }

    @Test
    public void aLongMessageIsSeveralEntriesAndNoCharacterIsCut() {
        CoreApplication.install(application);
        ShadowLog.clear();
        final String key = repeat("x", 964) + repeat("😀", 3000);
        logKey(key);
        final List<String> entries = entries();
        final String message = "jBundleToBundle: unknown field name " + key + ", ingoring";
        String joined = "";
        for (int index = 0; joined.length() < message.length(); index++) {
            final String entry = entries.get(index);
            assertEquals(false, Character.isHighSurrogate(entry.charAt(entry.length() - 1)));
            assertEquals(true, entry.length() <= 1000);
            joined += entry;
        }
        assertEquals(message, joined);
    }
}
