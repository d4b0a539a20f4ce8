package korvel.talvox.impl;

import java.io.ByteArrayInputStream;
import java.io.ByteArrayOutputStream;
import java.io.File;
import java.io.FileInputStream;
import java.io.IOException;
import java.io.InputStream;
import java.nio.charset.StandardCharsets;
import java.security.cert.CertificateException;
import java.security.cert.CertificateFactory;
import org.jspecify.annotations.Nullable;

/** A file of certificates in PEM form, looked at before the network layer uses it. */
public final class CertificateFile {
    private static final int MOST_BYTES = 16 << 20;
    private static final int PIECE_BYTES = 8192;
    private static final String BEGIN = "-----BEGIN CERTIFICATE-----";
    private static final String END = "-----END CERTIFICATE-----";

    private CertificateFile() {}

    /**
     * Lets the network layer trust the certificates of a file.
     *
     * @param file null for the authorities of the system
     * @throws IllegalArgumentException as {@link #check}; nothing changes then
     */
    public static void use(@Nullable File file) {
        if (file != null) {
            check(file);
        }
        Talvox.setCertificateFile(file == null ? "" : file.getAbsolutePath());
    }

    /**
     * @throws IllegalArgumentException with the reason, unless the file can be read and holds one or
     *     more certificates, all of them whole
     */
    private static void check(File file) {
        final String text;
        try {
            text = read(file);
        } catch (IOException failure) {
            throw refusal(file, "cannot be read: " + failure.getMessage(), failure);
        }
        int begin = text.indexOf(BEGIN);
        if (begin < 0) {
            throw refusal(file, "holds no PEM certificate", null);
        }
        for (int number = 1; begin >= 0; number++) {
            final int end = text.indexOf(END, begin);
            if (end < 0) {
                throw refusal(file, "certificate " + number + " in it has no end", null);
            }
            try {
                parse(text.substring(begin, end + END.length()));
            } catch (CertificateException failure) {
                throw refusal(file, "certificate " + number + " in it is broken", failure);
            }
            begin = text.indexOf(BEGIN, end);
        }
    }

    private static void parse(String pem) throws CertificateException {
        CertificateFactory.getInstance("X.509")
                .generateCertificate(
                        new ByteArrayInputStream(pem.getBytes(StandardCharsets.ISO_8859_1)));
    }

    private static String read(File file) throws IOException {
        if (!file.isFile()) {
            throw new IOException(file.exists() ? "it is not a file" : "there is no such file");
        }
        final ByteArrayOutputStream bytes = new ByteArrayOutputStream();
        try (InputStream input = new FileInputStream(file)) {
            final byte[] piece = new byte[PIECE_BYTES];
            int size = input.read(piece);
            while (size > 0) {
                bytes.write(piece, 0, size);
                if (bytes.size() > MOST_BYTES) {
                    throw new IOException("it is larger than " + MOST_BYTES + " bytes");
                }
                size = input.read(piece);
            }
        }
        return bytes.toString("ISO-8859-1");
    }

    private static IllegalArgumentException refusal(
            File file, String reason, @Nullable Exception cause) {
        return new IllegalArgumentException("certificate file " + file + ": " + reason, cause);
    }
}
