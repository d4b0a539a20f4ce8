package korvel.talvox.demo;

import java.io.ByteArrayOutputStream;
import java.io.File;
import java.io.IOException;
import java.nio.file.Files;
import javax.sound.sampled.AudioFormat;
import javax.sound.sampled.AudioInputStream;
import javax.sound.sampled.AudioSystem;
import javax.sound.sampled.UnsupportedAudioFileException;

/** Speech from a file: 16-bit mono, either WAV or raw at 16 kHz. */
final class SpeechFile {
    private static final int RAW_RATE_HZ = 16000;

    final byte[] samples;
    final int sampleRateHz;

    private SpeechFile(byte[] samples, int sampleRateHz) {
        this.samples = samples;
        this.sampleRateHz = sampleRateHz;
    }

    static SpeechFile read(String name) throws IOException {
        final File file = new File(name);
        if (!name.endsWith(".wav")) {
            return new SpeechFile(Files.readAllBytes(file.toPath()), RAW_RATE_HZ);
        }
        try (AudioInputStream sound = AudioSystem.getAudioInputStream(file)) {
            final AudioFormat format = sound.getFormat();
            if (format.getChannels() != 1 || format.getSampleSizeInBits() != 16) {
                throw new IOException(name + " is not 16-bit mono but " + format);
            }
            final ByteArrayOutputStream samples = new ByteArrayOutputStream();
            sound.transferTo(samples);
            return new SpeechFile(samples.toByteArray(), (int) format.getSampleRate());
        } catch (UnsupportedAudioFileException unsupported) {
            throw new IOException(name + " is no WAV file", unsupported);
        }
    }
}
