package korvel.talvox.impl;

import android.speech.SpeechRecognizer;
import korvel.talvox.SpeechError;

/**
 * What the platform's error numbers mean to the engine. The one table of it:
 *
 * <table>
 *   <caption>Errors of {@link SpeechRecognizer}</caption>
 *   <tr><th>platform</th><th>engine</th></tr>
 *   <tr><td>1 network time-out, 2 network</td><td>{@code ErrorNetwork}</td></tr>
 *   <tr><td>3 audio, 9 insufficient permissions</td><td>{@code ErrorAudio}</td></tr>
 *   <tr><td>4 server, 11 server disconnected</td><td>{@code ErrorServer}</td></tr>
 *   <tr><td>5 client, every number not listed</td><td>{@code ErrorUnknown}</td></tr>
 *   <tr><td>6 speech time-out</td><td>{@code ErrorNoVoice}</td></tr>
 *   <tr><td>7 no match</td><td>−1: empty results, not an error</td></tr>
 *   <tr><td>8 recognizer busy, 10 too many requests</td><td>{@code ErrorBusy}</td></tr>
 *   <tr><td>12 language not supported, 13 language unavailable</td>
 *       <td>{@code ErrorNotAvailable}</td></tr>
 * </table>
 */
public final class PlatformErrors {
    /** The session ended without a hypothesis. */
    public static final int NO_HYPOTHESIS = -1;

    private static final String[] NAMES = {
        "",
        "ERROR_NETWORK_TIMEOUT",
        "ERROR_NETWORK",
        "ERROR_AUDIO",
        "ERROR_SERVER",
        "ERROR_CLIENT",
        "ERROR_SPEECH_TIMEOUT",
        "ERROR_NO_MATCH",
        "ERROR_RECOGNIZER_BUSY",
        "ERROR_INSUFFICIENT_PERMISSIONS",
        "ERROR_TOO_MANY_REQUESTS",
        "ERROR_SERVER_DISCONNECTED",
        "ERROR_LANGUAGE_NOT_SUPPORTED",
        "ERROR_LANGUAGE_UNAVAILABLE",
        "ERROR_CANNOT_CHECK_SUPPORT",
        "ERROR_CANNOT_LISTEN_TO_DOWNLOAD_EVENTS"
    };

    private PlatformErrors() {}

    /** The number with its name in {@link SpeechRecognizer}, if it has one. */
    static String describe(int platformError) {
        return platformError > 0 && platformError < NAMES.length
                ? platformError + " (" + NAMES[platformError] + ")"
                : String.valueOf(platformError);
    }

    /**
     * @param platformError a number that the platform handed to {@code onError}
     * @return a code of {@link SpeechError} or {@link #NO_HYPOTHESIS}
     */
    public static int toEngine(int platformError) {
        switch (platformError) {
            case SpeechRecognizer.ERROR_NETWORK_TIMEOUT:
            case SpeechRecognizer.ERROR_NETWORK:
                return SpeechError.NETWORK.getCode();
            case SpeechRecognizer.ERROR_AUDIO:
            case SpeechRecognizer.ERROR_INSUFFICIENT_PERMISSIONS:
                return SpeechError.AUDIO.getCode();
            case SpeechRecognizer.ERROR_SERVER:
            case SpeechRecognizer.ERROR_SERVER_DISCONNECTED:
                return SpeechError.SERVER.getCode();
            case SpeechRecognizer.ERROR_SPEECH_TIMEOUT:
                return SpeechError.NO_VOICE.getCode();
            case SpeechRecognizer.ERROR_NO_MATCH:
                return NO_HYPOTHESIS;
            case SpeechRecognizer.ERROR_RECOGNIZER_BUSY:
            case SpeechRecognizer.ERROR_TOO_MANY_REQUESTS:
                return SpeechError.BUSY.getCode();
            case SpeechRecognizer.ERROR_LANGUAGE_NOT_SUPPORTED:
            case SpeechRecognizer.ERROR_LANGUAGE_UNAVAILABLE:
                return SpeechError.NOT_AVAILABLE.getCode();
            default:
                return SpeechError.UNKNOWN.getCode();
        }
    }
}
