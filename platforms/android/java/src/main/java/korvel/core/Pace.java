package korvel.core;

import java.util.concurrent.TimeUnit;

/** Compares the sound that has been delivered with the time since it began. Used by one thread. */
final class Pace {
    private final long bytesPerSecond;
    private final long beginNs = System.nanoTime();
    private long deliveredBytes;

    Pace(long bytesPerSecond) {
        this.bytesPerSecond = bytesPerSecond;
    }

    /** Adds to what has been delivered; waits while that is further ahead than allowed. */
    void waitUnlessDue(int bytes, long leadMs) throws InterruptedException {
        deliveredBytes += bytes;
        final long aheadNs =
                deliveredBytes * TimeUnit.SECONDS.toNanos(1) / bytesPerSecond
                        - (System.nanoTime() - beginNs);
        TimeUnit.NANOSECONDS.sleep(aheadNs - TimeUnit.MILLISECONDS.toNanos(leadMs));
    }
}
