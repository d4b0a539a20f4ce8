package korvel.talvox;

import android.util.Log;
import java.util.ArrayDeque;
import java.util.Queue;
import java.util.concurrent.Executor;
import java.util.concurrent.RejectedExecutionException;

/** Runs tasks on another executor, one at a time and in order, whatever that executor does. */
final class SerialExecutor implements Executor {
    private static final String TAG = "Talvox";

    private final Executor executor;
    private final Queue<Runnable> tasks = new ArrayDeque<>();
    private boolean draining;

    SerialExecutor(Executor executor) {
        this.executor = executor;
    }

    /** Never throws because of the executor: an event that it refuses is logged and lost. */
    @Override
    public void execute(Runnable task) {
        synchronized (tasks) {
            tasks.add(task);
            if (draining) {
                return;
            }
            draining = true;
        }
        scheduleDrain();
    }

    private void scheduleDrain() {
        try {
            executor.execute(this::drain);
        } catch (RejectedExecutionException refused) {
            Log.e(TAG, "the executor for events refuses them: they are lost", refused);
            synchronized (tasks) {
                tasks.clear();
                draining = false;
            }
        }
    }

    private void drain() {
        while (true) {
            final Runnable task;
            synchronized (tasks) {
                task = tasks.poll();
                if (task == null) {
                    draining = false;
                    return;
                }
            }
            boolean done = false;
            try {
                task.run();
                done = true;
            } finally {
                if (!done) {
                    goOnAfterFailure();
                }
            }
        }
    }

    /** What a task throws belongs to the executor; the tasks behind it run all the same. */
    private void goOnAfterFailure() {
        synchronized (tasks) {
            if (tasks.isEmpty()) {
                draining = false;
                return;
            }
        }
        scheduleDrain();
    }
}
