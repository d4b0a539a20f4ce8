package korvel.talvox.impl;

import android.os.Bundle;
import android.util.Log;
import java.util.ArrayList;
import java.util.BitSet;
import java.util.Collections;
import java.util.List;
import java.util.function.Function;
import org.jspecify.annotations.Nullable;

/**
 * A bundle that another application sent. It may hold anything: a value of another type than asked
 * for, or of a class that this application does not have, counts as absent.
 */
final class ReceivedBundle {
    private static final String TAG = "Talvox";

    private final Bundle bundle;

    /** @param bundle null counts as empty */
    ReceivedBundle(@Nullable Bundle bundle) {
        this.bundle = bundle != null ? bundle : Bundle.EMPTY;
    }

    /** The text, or an empty one. */
    String getText(String key) {
        final String text = read(key, bundle::getString);
        return text != null ? text : "";
    }

    /** The texts of the list; none if there is no list. */
    Texts getTexts(String key) {
        // Not getStringArrayList: newer versions of Android return null for a list that holds one
        // entry of another type.
        final Object list = read(key, bundle::get);
        return new Texts(key, list instanceof List ? (List<?>) list : Collections.emptyList());
    }

    /** The numbers, or null. */
    float @Nullable [] getFloats(String key) {
        return read(key, bundle::getFloatArray);
    }

    private static <T> @Nullable T read(
            String key, Function<String, @Nullable T> getter) {
        try {
            return getter.apply(key);
        } catch (RuntimeException unreadable) {
            Log.w(TAG, key + " from another application cannot be read", unreadable);
            return null;
        }
    }

    /** The entries of a list that are texts, in order. */
    static final class Texts {
        private final String key;
        private final int size;
        private final BitSet kept = new BitSet();
        private final String[] texts;

        private Texts(String key, List<?> list) {
            this.key = key;
            size = list.size();
            final List<String> found = new ArrayList<>(size);
            for (int index = 0; index < size; index++) {
                final Object entry = list.get(index);
                if (entry instanceof String) {
                    kept.set(index);
                    found.add((String) entry);
                }
            }
            texts = found.toArray(new String[0]);
        }

        String[] toArray() {
            return texts;
        }

        /**
         * The scores of the texts.
         *
         * @param scores one for each entry of the list, or null
         * @return null if there is not one score for each entry
         */
        float @Nullable [] align(float @Nullable [] scores) {
            if (scores == null || scores.length != size) {
                return null;
            }
            final float[] aligned = new float[texts.length];
            int next = 0;
            for (int index = kept.nextSetBit(0); index >= 0; index = kept.nextSetBit(index + 1)) {
                aligned[next++] = scores[index];
            }
            return aligned;
        }

        /** Logs how many entries were left out, if any. */
        void logOmitted() {
            final int omitted = size - texts.length;
            if (omitted > 0) {
                Log.w(TAG, omitted + " of " + size + " entries of " + key + " are not texts, ignored");
            }
        }
    }
}
