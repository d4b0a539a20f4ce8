package korvel.core;

/** Joins pieces of any size to pieces of whole samples. Used by one thread. */
final class WholeSamples {
    private static final int BYTES_PER_SAMPLE = 2;

    private final byte[] joined;
    private boolean hasHalf;
    private byte half;

    /**
     * @param sizeMax of a piece, in bytes
     */
    WholeSamples(int sizeMax) {
        joined = new byte[sizeMax + 1];
    }

    /** Takes the next piece; returns how many bytes {@link #getBytes} has of it. */
    int join(byte[] piece, int size) {
        int begin = 0;
        if (hasHalf) {
            joined[0] = half;
            begin = 1;
        }
        System.arraycopy(piece, 0, joined, begin, size);
        final int total = begin + size;
        hasHalf = total % BYTES_PER_SAMPLE != 0;
        if (hasHalf) {
            half = joined[total - 1];
        }
        return total - total % BYTES_PER_SAMPLE;
    }

    /** The same array each time; the next {@link #join} overwrites it. */
    byte[] getBytes() {
        return joined;
    }
}
