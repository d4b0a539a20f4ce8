package korvel.talvox.impl;

/**
 * Owns one native object: it is released exactly once, by its last user, and never used
 * afterwards. All methods may be called from any thread, also from inside a use; no monitor is held
 * while native code runs.
 */
public final class NativeHandle {
    /** Something done with the handle. */
    public interface Operation {
        void run(long handle);
    }

    private final long handle;
    private final Operation release;
    private int users = 1;
    private boolean closed;

    /**
     * @param handle the native object
     * @param release called once with {@code handle}, after {@link #close} and outside every use
     */
    public NativeHandle(long handle, Operation release) {
        this.handle = handle;
        this.release = release;
    }

    /**
     * Runs {@code operation} unless the handle is closed.
     *
     * @return false if the handle is closed
     */
    public boolean use(Operation operation) {
        synchronized (this) {
            if (closed) {
                return false;
            }
            users++;
        }
        try {
            operation.run(handle);
        } finally {
            leave();
        }
        return true;
    }

    /** Lets no further use begin and releases the object as soon as none is under way. */
    public void close() {
        synchronized (this) {
            if (closed) {
                return;
            }
            closed = true;
        }
        leave();
    }

    private void leave() {
        synchronized (this) {
            users--;
            if (users > 0) {
                return;
            }
        }
        release.run(handle);
    }
}
