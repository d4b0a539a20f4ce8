package korvel.talvox;

import android.util.Log;
import java.util.ArrayDeque;
import java.util.Queue;
import java.util.concurrent.Executor;
import org.jspecify.annotations.Nullable;

/**
 * Runs tasks on another executor, one at a time and in order, whatever that executor does.
 *
 * <p>The executor is asked for a turn, in which all tasks that wait are run. Where it throws instead
 * of taking a turn, the first of them is lost and the executor is asked again for the rest.
 */
final class SerialExecutor implements Executor {
    private static final String TAG = "Talvox";

    private final Executor executor;
    private final Queue<Task> tasks = new ArrayDeque<>();

    /** A turn is asked for or under way. Of {@code tasks}. */
    private boolean draining;

    SerialExecutor(Executor executor) {
        this.executor = executor;
    }

    private static final class Task {
        final Runnable action;
        final Runnable whenLost;

        Task(Runnable action, Runnable whenLost) {
            this.action = action;
            this.whenLost = whenLost;
        }
    }

    /** A turn, taken once: by the executor, or by this class if the executor has thrown first. */
    private final class Turn implements Runnable {
        private boolean taken;
        private @Nullable Throwable failure;

        @Override
        public void run() {
            if (take()) {
                drain(this);
            }
        }

        synchronized boolean take() {
            final boolean first = !taken;
            taken = true;
            return first;
        }

        synchronized void setFailure(Throwable value) {
            failure = value;
        }

        synchronized boolean failedWith(Throwable value) {
            return failure == value;
        }
    }

    /** As {@link #execute(Runnable, Runnable)}, for a task whose loss has no further effect. */
    @Override
    public void execute(Runnable action) {
        execute(action, () -> {});
    }

    /**
     * Runs {@code action} after the tasks before it. Nothing that the executor throws goes further;
     * what a task throws is the executor's, and comes here if that runs tasks at once.
     *
     * @param whenLost called instead, perhaps on this thread, if the executor does not take it
     */
    void execute(Runnable action, Runnable whenLost) {
        synchronized (tasks) {
            tasks.add(new Task(action, whenLost));
            if (draining) {
                return;
            }
            draining = true;
        }
        askForTurn();
    }

    private void askForTurn() {
        boolean isAsking = true;
        while (isAsking) {
            final Turn turn = new Turn();
            try {
                executor.execute(turn);
                isAsking = false;
            } catch (Throwable failure) {
                if (turn.failedWith(failure)) {
                    throw failure;
                }
                if (turn.take()) {
                    Log.e(TAG, "the executor refuses an event, which is lost", failure);
                    isAsking = loseFirst();
                } else {
                    Log.e(TAG, "the executor has taken an event, and thrown", failure);
                    isAsking = false;
                }
            }
        }
    }

    /** Returns whether tasks are left. */
    private boolean loseFirst() {
        final Task lost;
        final boolean isMoreLeft;
        synchronized (tasks) {
            lost = tasks.remove();
            isMoreLeft = !tasks.isEmpty();
            draining = isMoreLeft;
        }
        lost.whenLost.run();
        return isMoreLeft;
    }

    private void drain(Turn turn) {
        while (true) {
            final Task task;
            synchronized (tasks) {
                task = tasks.poll();
                if (task == null) {
                    draining = false;
                    return;
                }
            }
            try {
                task.action.run();
            } catch (Throwable failure) {
                turn.setFailure(failure);
                goOnAfterFailure();
                throw failure;
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
        try {
            askForTurn();
        } catch (Throwable next) {
            Log.e(TAG, "an event after one that has thrown has thrown as well", next);
        }
    }
}
