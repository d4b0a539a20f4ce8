package bare;

import android.os.Bundle;
import java.util.Arrays;
import korvel.talvox.impl.PlatformRecognizer;
import korvel.talvox.impl.Recognizer;
import korvel.talvox.impl.Talvox;

/**
 * An application on the native methods alone. Its first argument says what it does; it prints the
 * events. Each session but the last is misused, and the last shows that the next one works.
 */
public final class Program {
    private static final int LONG_TEXT = 2000;

    private static long engine;

    private Program() {}

    /** Something done with a session whose device recognizer has this handle. */
    private interface Misuse {
        void run(long device, long session);
    }

    private static void print(String line) {
        System.out.println(line);
    }

    private static void session(Misuse misuse) {
        final Bundle settings = new Bundle();
        settings.putString("asrpolicy", "platform_only");
        settings.putString("logging", "without_sound_always");
        final long session = Recognizer.start(engine, new Recognizer(settings, Program::print));
        misuse.run(PlatformRecognizer.newest, session);
        Recognizer.releaseRecognizer(session);
    }

    private static void results(long device, float[] scores, String... texts) {
        PlatformRecognizer.onResultsInternal(device, texts, scores);
    }

    /** A session in which one method of the device recognizer throws. */
    private static void throwing(String method, Misuse misuse) {
        PlatformRecognizer.THROWING.add(method);
        PlatformRecognizer.CALLS.setLength(0);
        session(misuse);
        PlatformRecognizer.THROWING.clear();
        print("calls: " + PlatformRecognizer.CALLS);
    }

    private static void attempt(Runnable call) {
        try {
            call.run();
            print("returns");
        } catch (RuntimeException refused) {
            print(refused.getClass().getSimpleName());
        }
    }

    private static void stale(long handle) {
        attempt(() -> PlatformRecognizer.onReadyForSpeechInternal(handle));
        attempt(() -> PlatformRecognizer.onBufferReceivedInternal(handle, null));
        attempt(() -> PlatformRecognizer.onPartialResultsInternal(handle, null, null));
        attempt(() -> PlatformRecognizer.onResultsInternal(handle, null, null));
        attempt(() -> PlatformRecognizer.onErrorInternal(handle, Integer.MIN_VALUE));
        attempt(() -> PlatformRecognizer.onEventInternal(handle, 0, null));
    }

    private static void many(int count, String text) {
        final String[] texts = new String[count];
        Arrays.fill(texts, text);
        session((device, session) -> PlatformRecognizer.onResultsInternal(device, texts, null));
    }

    private static void misuse(String what, String argument) {
        switch (what) {
            case "languages":
                PlatformRecognizer.languages = new Object[] {null, 7, "xx-XX", new Bundle(), "aa"};
                print(String.valueOf(Talvox.getAvailableLanguages(engine)));
                break;
            case "noLanguages":
                PlatformRecognizer.THROWING.add("getAvailableLanguages");
                print(String.valueOf(Talvox.getAvailableLanguages(engine)));
                PlatformRecognizer.THROWING.clear();
                break;
            case "scores":
                session((device, session) -> results(device, new float[] {0.9f}, "a", "b"));
                session((device, session) -> results(device, new float[] {0.9f, 0.8f}, "a"));
                break;
            case "partial":
                session(
                        (device, session) -> {
                            PlatformRecognizer.onPartialResultsInternal(
                                    device, new String[] {"a"}, new float[0]);
                            PlatformRecognizer.onPartialResultsInternal(device, null, null);
                            PlatformRecognizer.onPartialResultsInternal(
                                    device, new String[] {"a"}, new float[] {0.9f});
                            results(device, null, "a");
                        });
                break;
            case "codes":
                for (int code : new int[] {-2, 9, 100, Integer.MIN_VALUE, Integer.MAX_VALUE}) {
                    session(
                            (device, session) -> {
                                PlatformRecognizer.onErrorInternal(device, code);
                                PlatformRecognizer.onErrorInternal(device, code);
                            });
                }
                break;
            case "new":
            case "start":
                throwing(what, (device, session) -> {});
                break;
            case "stop":
                throwing(what, (device, session) -> Recognizer.stop(session));
                break;
            case "cancel":
                throwing(what, (device, session) -> Recognizer.cancel(session));
                break;
            case "properties":
                for (String name : new String[] {"getSource", "getLanguagePreference", "getModel"}) {
                    throwing(name, (device, session) -> results(device, null, "a"));
                }
                break;
            case "nulls":
                session((device, session) -> PlatformRecognizer.onResultsInternal(
                        device, null, new float[1]));
                session(
                        (device, session) -> {
                            PlatformRecognizer.onBufferReceivedInternal(device, null);
                            PlatformRecognizer.onEventInternal(device, 0, null);
                            results(device, new float[] {0.9f, 0.1f, 0.2f}, "a", null, "b");
                        });
                session((device, session) -> results(device, null, (String) null));
                break;
            case "stale":
                session((device, session) -> Recognizer.cancel(session));
                stale(PlatformRecognizer.newest);
                stale(0);
                stale(-1);
                break;
            case "many":
                many(Integer.parseInt(argument), "w");
                break;
            case "full":
                many(Integer.parseInt(argument), new String(new char[LONG_TEXT]));
                break;
            default:
                throw new IllegalArgumentException(what);
        }
    }

    public static void main(String[] arguments) {
        System.loadLibrary("KorvelTalvox");
        engine = Talvox.getHandle();
        Talvox.updateSettingsFromXml(
                engine,
                "<startup><features><voice><url>http://127.0.0.1:9/</url>"
                        + "<uuid>0123456789abcdef0123456789abcdef</uuid>"
                        + "</voice></features></startup>");
        misuse(arguments[0], arguments.length > 1 ? arguments[1] : "");
        print("next");
        session((device, session) -> results(device, null, "next"));
    }
}
