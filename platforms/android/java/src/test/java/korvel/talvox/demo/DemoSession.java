package korvel.talvox.demo;

import java.util.concurrent.CountDownLatch;
import korvel.talvox.Hypothesis;
import korvel.talvox.Recognition;
import korvel.talvox.RecognitionListener;
import korvel.talvox.SoundFormat;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.support.DevelopmentGateway;
import korvel.talvox.support.KitTest;
import korvel.talvox.support.Microphone;
import org.junit.Test;

/** What the demo does; as code of an application, apart from the microphone. */
public class DemoSession extends KitTest {
    private static final long BEGIN = System.nanoTime();
    private static final TalvoxSettings NOTHING_ELSE = TalvoxSettings.builder().build();

    /** Prints each event with its time. */
    private static final class Printer implements RecognitionListener {
        private final Microphone microphone;
        private final byte[] speech;
        private final CountDownLatch over = new CountDownLatch(1);
        private int buffers;
        private int levels;

        Printer(Microphone microphone, byte[] speech) {
            this.microphone = microphone;
            this.speech = speech;
        }

        private static void print(String event) {
            System.out.printf("%7.3f s  %s%n", (System.nanoTime() - BEGIN) / 1e9, event);
        }

        @Override
        public void onRecordingBegin() {
            print("recording began");
            microphone.say(speech);
        }

        @Override
        public void onSpeakingBegin() {
            print("speech began");
        }

        @Override
        public void onBufferReceived(byte[] pcm) {
            buffers++;
        }

        @Override
        public void onPowerChanged(float level) {
            levels++;
        }

        @Override
        public void onRecordingDone() {
            print("recording done, " + buffers + " buffers, " + levels + " levels");
        }

        @Override
        public void onResults(Recognition recognition) {
            print("results: " + recognition.getOutcome());
            for (Hypothesis hypothesis : recognition.getHypotheses()) {
                print("  " + hypothesis);
            }
            over.countDown();
        }

        @Override
        public void onError(SpeechError error) {
            print("error: " + error);
            over.countDown();
        }
    }

    @Test
    public void recognise() throws Exception {
        final SpeechFile speech = SpeechFile.read(System.getProperty("talvox.demo.file"));
        final TalvoxEngine engine = TalvoxEngine.getInstance(application);
        try (DevelopmentGateway gateway = new DevelopmentGateway();
                Microphone microphone = new Microphone(speech.sampleRateHz, 1).plugIn()) {
            engine.updateSettings(
                    TalvoxSettings.builder()
                            .set(TalvoxSettings.URL, gateway.getUrl())
                            .set(TalvoxSettings.UUID, "0123456789abcdef0123456789abcdef")
                            .set(TalvoxSettings.LANGUAGE, "en-US")
                            .set(TalvoxSettings.STREAMING, true)
                            .set(TalvoxSettings.SOUND_FORMAT, SoundFormat.SPEEX)
                            .set(TalvoxSettings.SAMPLE_RATE, speech.sampleRateHz)
                            .build());
            Printer.print("engine " + engine.getVersion() + ", gateway " + gateway.getUrl());
            final Printer printer = new Printer(microphone, speech.samples);
            try (TalvoxRecognizer recognizer = engine.createRecognizer(NOTHING_ELSE, printer)) {
                recognizer.start();
                await(printer.over);
            }
        }
    }
}
