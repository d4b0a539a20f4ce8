package korvel.core;

import android.util.Log;

/** Android's log for the native library. */
final class LogBackend {
    static final String TAG = "Talvox";

    /** Longer entries are cut by Android: its limit is about 4000 bytes of UTF-8. */
    private static final int ENTRY_LENGTH_MAX = 1000;

    private LogBackend() {}

    /** Called by the native library, one message at a time, on any thread. */
    private static void write(String message) {
        int begin = 0;
        do {
            final int end = findEnd(message, begin);
            Log.i(TAG, message.substring(begin, end));
            begin = end;
        } while (begin < message.length());
    }

    /** Cuts a long message, but not between the halves of a character. */
    private static int findEnd(String message, int begin) {
        final int end = begin + ENTRY_LENGTH_MAX;
        if (end >= message.length()) {
            return message.length();
        }
        return Character.isHighSurrogate(message.charAt(end - 1)) ? end - 1 : end;
    }
}
