package korvel.core;

import static org.junit.Assert.assertArrayEquals;
import static org.junit.Assert.assertEquals;

import java.util.Arrays;
import org.junit.Test;

/** Pieces of any size. */
public class WholeSamplesTest {
    private final WholeSamples samples = new WholeSamples(4);

    private void assertJoined(String piece, String whole) {
        final byte[] bytes = Arrays.copyOf(piece.getBytes(), 4);
        final int size = samples.join(bytes, piece.length());
        assertEquals(whole.length(), size);
        assertArrayEquals(whole.getBytes(), Arrays.copyOf(samples.getBytes(), size));
    }

    @Test
    public void evenPiecesStayAsTheyAre() {
        assertJoined("abcd", "abcd");
        assertJoined("ef", "ef");
    }

    @Test
    public void halfASampleWaitsForItsOtherHalf() {
        assertJoined("a", "");
        assertJoined("b", "ab");
        assertJoined("cde", "cd");
        assertJoined("fghi", "efgh");
        assertJoined("jkl", "ijkl");
    }
}
