package korvel.talvox;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertFalse;
import static org.junit.Assert.assertNotNull;
import static org.junit.Assert.assertNull;
import static org.junit.Assert.assertSame;
import static org.junit.Assert.assertThrows;
import static org.junit.Assert.assertTrue;

import android.os.Bundle;
import java.io.IOException;
import java.lang.reflect.InvocationTargetException;
import java.lang.reflect.Method;
import java.nio.file.Files;
import java.nio.file.Paths;
import java.util.Arrays;
import java.util.HashMap;
import java.util.List;
import java.util.Map;
import java.util.Set;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import java.util.stream.Collectors;
import korvel.talvox.impl.Recognizer;
import korvel.talvox.impl.Talvox;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import korvel.talvox.util.LogCollector;
import org.junit.Test;

public class TalvoxEngineTest extends EngineTestCase {
    @Test
    public void isOnePerProcess() {
        assertSame(engine, TalvoxEngine.getInstance(application));
        assertEquals("133", engine.getVersion());
    }

    @Test
    public void hasExactlyTheKeysOfTheNativeTable() {
        final Bundle table = Talvox.getSettings(Talvox.getHandle());
        final Set<String> names =
                TalvoxSettings.keys().stream()
                        .map(SettingKey::getName)
                        .collect(Collectors.toSet());
        assertEquals(table.keySet(), names);
        assertEquals(table.size(), TalvoxSettings.keys().size());
        final TalvoxSettings settings = engine.getSettings();
        for (SettingKey<?> key : TalvoxSettings.keys()) {
            assertNotNull("of another type: " + key, settings.get(key));
        }
    }

    @Test
    public void everyChoiceHasExactlyTheNativeValues() throws IOException {
        final Map<String, SettingValue[]> choices = new HashMap<>();
        choices.put("ASRO_", AsrOverride.values());
        choices.put("ASRP_", AsrPolicy.values());
        choices.put("LOG_", LoggingPolicy.values());
        choices.put("EVENTS_LOG_", EventsLogging.values());
        choices.put("SOUND_FORMAT_", SoundFormat.values());
        choices.put("SESSION_MODE_", SessionMode.values());
        choices.put("MODEL_", RecognitionModel.values());
        final String source =
                new String(
                        Files.readAllBytes(
                                Paths.get(
                                        System.getProperty("talvox.root"),
                                        "talvox/SettingsTable.cpp")));
        for (Map.Entry<String, SettingValue[]> choice : choices.entrySet()) {
            final Matcher constant =
                    Pattern.compile("Settings::" + choice.getKey() + "(\\w+)\\(\\s*\"([^\"]*)\"\\)")
                            .matcher(source);
            final Map<String, String> expected = new HashMap<>();
            while (constant.find()) {
                expected.put(constant.group(1), constant.group(2));
            }
            final Map<String, String> actual = new HashMap<>();
            for (SettingValue value : choice.getValue()) {
                actual.put(value.toString(), value.getText());
            }
            assertEquals(choice.getKey(), expected, actual);
        }
    }

    @Test
    public void updatesWhatIsSetAndKeepsTheRest() {
        engine.updateSettings(
                TalvoxSettings.builder()
                        .set(TalvoxSettings.SOUND_FORMAT, SoundFormat.SPEEX)
                        .set(TalvoxSettings.MAP_CENTER, new LatLon(55.75, 37.5))
                        .build());
        final TalvoxSettings settings = engine.getSettings();
        assertEquals(SoundFormat.SPEEX, settings.get(TalvoxSettings.SOUND_FORMAT));
        assertEquals(new LatLon(55.75, 37.5), settings.get(TalvoxSettings.MAP_CENTER));
        assertEquals("ru-RU", settings.get(TalvoxSettings.LANGUAGE));
    }

    @Test
    public void updatesFromXml() {
        engine.updateSettingsFromXml(
                "<startup><features><voice><url>http://example.org</url>"
                        + "<samplerate>8000</samplerate><asr>sometimes</asr>"
                        + "</voice></features></startup>");
        final TalvoxSettings settings = engine.getSettings();
        assertEquals("http://example.org", settings.get(TalvoxSettings.URL));
        assertEquals(8000, (int) settings.get(TalvoxSettings.SAMPLE_RATE));
        assertNull(settings.get(TalvoxSettings.ASR_OVERRIDE));
        engine.updateSettingsFromXml("no XML at all");
        assertEquals("http://example.org", engine.getSettings().get(TalvoxSettings.URL));
    }

    private void setEventsLogging(EventsLogging value) {
        engine.updateSettings(
                TalvoxSettings.builder().set(TalvoxSettings.EVENTS_LOGGING, value).build());
    }

    private void setEventsLoggingByXml(String child) {
        engine.updateSettingsFromXml(
                "<startup><features><voice>" + child + "</voice></features></startup>");
    }

    private void assertEventsLogging(boolean isOn) {
        assertEquals(isOn, LogCollector.isLoggingEnabled());
        assertEquals(
                isOn ? EventsLogging.ENABLED : EventsLogging.DISABLED,
                engine.getSettings().get(TalvoxSettings.EVENTS_LOGGING));
    }

    @Test
    public void theSettingSwitchesUsageLoggingWhereItIsSet() {
        try {
            assertEventsLogging(false);
            setEventsLogging(EventsLogging.ENABLED);
            assertEventsLogging(true);
            useGateway("http://127.0.0.1:9");
            assertEventsLogging(true);
            setEventsLogging(EventsLogging.DISABLED);
            assertEventsLogging(false);
            LogCollector.setLoggingEnabled(true);
            useGateway("http://127.0.0.1:9");
            assertEventsLogging(true);
            engine.updateSettings(engine.getSettings());
            assertEventsLogging(true);
            setEventsLogging(EventsLogging.DISABLED);
            assertEventsLogging(false);
        } finally {
            LogCollector.setLoggingEnabled(false);
        }
    }

    @Test
    public void soDoesADocumentThatSetsIt() {
        try {
            setEventsLoggingByXml("<eventslogging>enabled</eventslogging>");
            assertEventsLogging(true);
            setEventsLoggingByXml("<url>http://127.0.0.1:9</url>");
            assertEventsLogging(true);
            setEventsLoggingByXml("<Events_Logging>disabled</Events_Logging>");
            assertEventsLogging(false);
            LogCollector.setLoggingEnabled(true);
            setEventsLoggingByXml("<url>http://127.0.0.1:9</url>");
            assertEventsLogging(true);
            setEventsLoggingByXml("<eventslogging>perhaps</eventslogging>");
            assertEventsLogging(true);
            setEventsLoggingByXml("<eventslogging>disabled</eventslogging>");
            assertEventsLogging(false);
        } finally {
            LogCollector.setLoggingEnabled(false);
        }
    }

    @Test
    public void knowsWhetherRecognitionIsAvailable() {
        assertTrue(engine.isRecognitionAvailable(TalvoxSettings.builder().build()));
        assertFalse(
                engine.isRecognitionAvailable(
                        TalvoxSettings.builder()
                                .set(TalvoxSettings.ASR_POLICY, AsrPolicy.DISABLED)
                                .build()));
    }

    @Test
    public void hasTheLanguagesOfTheGateway() {
        final List<String> languages = engine.getAvailableLanguages();
        assertTrue(languages.containsAll(Arrays.asList("ru-RU", "tr-TR", "uk-UA")));
        assertEquals(languages.stream().sorted().collect(Collectors.toList()), languages);
    }

    @Test
    public void aRecognitionCannotHaveSettingsOfTheEngine() {
        final Events events = new Events();
        final TalvoxSettings mixed =
                TalvoxSettings.builder()
                        .set(TalvoxSettings.STREAMING, true)
                        .set(TalvoxSettings.LANGUAGE, "en-US")
                        .set(TalvoxSettings.URL, "http://example.org")
                        .build();
        assertEquals(
                "url, streaming: of the engine only, without effect on one recognition;"
                        + " set it with TalvoxEngine.updateSettings",
                assertThrows(
                                IllegalArgumentException.class,
                                () -> engine.createRecognizer(mixed, events))
                        .getMessage());
        final TalvoxSettings.Builder own = mixed.toBuilder();
        own.unset(TalvoxSettings.STREAMING).unset(TalvoxSettings.URL);
        engine.createRecognizer(own.build(), events).close();
        assertTrue(engine.isRecognitionAvailable(mixed));
    }

    @Test
    public void refusesNull() {
        final TalvoxSettings settings = TalvoxSettings.builder().build();
        final Events events = new Events();
        assertThrows(NullPointerException.class, () -> engine.updateSettings(null));
        assertThrows(NullPointerException.class, () -> engine.updateSettingsFromXml(null));
        assertThrows(NullPointerException.class, () -> engine.isRecognitionAvailable(null));
        assertThrows(NullPointerException.class, () -> engine.createRecognizer(null, events));
        assertThrows(NullPointerException.class, () -> engine.createRecognizer(settings, null));
        assertThrows(
                NullPointerException.class, () -> engine.createRecognizer(settings, events, null));
    }

    @Test
    public void nativeEntriesRefuseNullArgumentsAndForeignHandles() throws Exception {
        final long handle = Talvox.getHandle();
        final Bundle bundle = new Bundle();
        assertThrows(NullPointerException.class, () -> Talvox.updateSettings(handle, null));
        assertThrows(NullPointerException.class, () -> Talvox.updateSettingsFromXml(handle, null));
        assertThrows(NullPointerException.class, () -> Talvox.setCertificateFile(null));
        assertThrows(
                NullPointerException.class, () -> Talvox.isRecognitionAvailable(handle, null));
        for (long wrong : new long[] {0, 1, -1, handle + 8, Long.MIN_VALUE}) {
            assertThrows(IllegalStateException.class, () -> Talvox.getSettings(wrong));
            assertThrows(IllegalStateException.class, () -> Talvox.updateSettings(wrong, bundle));
            assertThrows(
                    IllegalStateException.class, () -> Talvox.updateSettingsFromXml(wrong, ""));
            assertThrows(
                    IllegalStateException.class,
                    () -> Talvox.isRecognitionAvailable(wrong, bundle));
            assertThrows(IllegalStateException.class, () -> Talvox.getAvailableLanguages(wrong));
            for (String name : Arrays.asList("stop", "cancel", "releaseRecognizer")) {
                final Method method = Recognizer.class.getDeclaredMethod(name, long.class);
                method.setAccessible(true);
                final InvocationTargetException refusal =
                        assertThrows(
                                InvocationTargetException.class, () -> method.invoke(null, wrong));
                assertEquals(IllegalStateException.class, refusal.getCause().getClass());
                assertNotNull(refusal.getCause().getMessage());
            }
        }
    }
}
