package korvel.talvox.impl;

import android.os.Bundle;
import java.util.concurrent.CountDownLatch;
import java.util.concurrent.TimeUnit;
import korvel.core.AudioRecorderBackend;
import korvel.core.SoundInput;

/**
 * A program on a plain JVM that ends while it records. Its argument says how: "return" from {@code
 * main}, "exit", or "hang": exit while the microphone hangs.
 */
final class EndingProgram {
    static final int EXIT_STATUS = 3;

    private static final int PIECE_MS = 20;
    private static final int PIECES_BEFORE_IT_HANGS = 50;

    /** Noise at the speed of real time, for a second or for ever. */
    private static final class Noise implements SoundInput {
        private final CountDownLatch never = new CountDownLatch(1);
        private final CountDownLatch hanging;
        private int pieces;

        Noise(CountDownLatch hanging) {
            this.hanging = hanging;
        }

        @Override
        public int read(byte[] buffer, int sizeInBytes) {
            try {
                if (hanging != null && ++pieces > PIECES_BEFORE_IT_HANGS) {
                    hanging.countDown();
                    never.await();
                }
                never.await(PIECE_MS, TimeUnit.MILLISECONDS);
            } catch (InterruptedException interrupted) {
                return 0;
            }
            for (int index = 0; index < sizeInBytes; index++) {
                buffer[index] = (byte) (index & 1);
            }
            return sizeInBytes;
        }

        @Override
        public void close() {}
    }

    /** Hears of the beginning. */
    private static final class Listener extends SilentEvents {
        private final CountDownLatch began = new CountDownLatch(1);

        @Override
        public void onRecordingBegin() {
            began.countDown();
        }
    }

    private EndingProgram() {}

    public static void main(String[] arguments) throws InterruptedException {
        NativeLibrary.load();
        final CountDownLatch hanging = arguments[0].equals("hang") ? new CountDownLatch(1) : null;
        AudioRecorderBackend.setInputFactory((rate, length, mode) -> new Noise(hanging));
        final long engine = Talvox.getHandle();
        Talvox.updateSettingsFromXml(
                engine,
                "<startup><features><voice><url>http://127.0.0.1:9/</url>"
                        + "<uuid>0123456789abcdef0123456789abcdef</uuid>"
                        + "</voice></features></startup>");
        final Listener listener = new Listener();
        Recognizer.start(engine, new Bundle(), listener);
        listener.began.await();
        if (hanging != null) {
            hanging.await();
        }
        if (!arguments[0].equals("return")) {
            System.exit(EXIT_STATUS);
        }
    }
}
