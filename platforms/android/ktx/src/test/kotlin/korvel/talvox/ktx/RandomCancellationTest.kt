package korvel.talvox.ktx

import java.util.concurrent.TimeUnit
import kotlin.random.Random
import korvel.talvox.SpeechError
import korvel.talvox.testing.FakeEngine
import korvel.talvox.testing.RecognitionBuilder
import korvel.talvox.testing.Script
import kotlinx.coroutines.CancellationException
import kotlinx.coroutines.CompletableDeferred
import kotlinx.coroutines.CoroutineScope
import kotlinx.coroutines.Deferred
import kotlinx.coroutines.Dispatchers
import kotlinx.coroutines.Job
import kotlinx.coroutines.SupervisorJob
import kotlinx.coroutines.async
import kotlinx.coroutines.cancel
import kotlinx.coroutines.coroutineScope
import kotlinx.coroutines.flow.take
import kotlinx.coroutines.launch
import kotlinx.coroutines.test.StandardTestDispatcher
import kotlinx.coroutines.test.TestCoroutineScheduler
import kotlinx.coroutines.yield
import org.junit.Assert.assertEquals
import org.junit.Assert.assertFalse
import org.junit.Assert.assertTrue
import org.junit.Test

/**
 * Sessions that are cut short at random moments, in every way in which a collection may end: each is
 * cancelled at most once and ends once, its recognizer is closed, and nothing is heard afterwards. A
 * seed gives the same run again.
 */
class RandomCancellationTest {
    private companion object {
        const val RUNS = 10_000
        const val PATIENCE_S = 120L
        const val LONGER_THAN_A_SESSION_MS = 60_000L
    }

    private enum class Cut {
        NOTHING,
        CANCEL,
        CANCEL_SCOPE,
        SIBLING_FAILS,
        COLLECTOR_FAILS,
        TAKE,
        STOP,
        STOP_FAILS,
    }

    private class Failure : Exception()

    /** A collection of one session, and what cuts it short. */
    private class Run(seed: Int) {
        val random = Random(seed)
        val name = "run $seed"
        val cut = Cut.entries[random.nextInt(Cut.entries.size)]
        val fake = FakeEngine().play(makeScript(random))
        val counted = CountingEngine(fake)
        val heard = mutableListOf<RecognitionEvent>()
        private val cutAfter = random.nextInt(1, 8)
        private val stop = CompletableDeferred<Unit>()
        private val siblingFails = CompletableDeferred<Unit>()

        private suspend fun collect() {
            val events = counted.engine.recognize(stopWhen = { stop.await() })
            (if (cut == Cut.TAKE) events.take(cutAfter) else events).collect {
                heard += it
                if (cut == Cut.COLLECTOR_FAILS && heard.size == cutAfter) {
                    throw Failure()
                }
            }
        }

        suspend fun collectBesideSibling() = coroutineScope {
            val sibling = launch {
                siblingFails.await()
                throw Failure()
            }
            collect()
            sibling.cancel()
        }

        fun cut(scope: CoroutineScope, collection: Job) {
            when (cut) {
                Cut.CANCEL -> collection.cancel()
                Cut.CANCEL_SCOPE -> scope.cancel()
                Cut.SIBLING_FAILS -> siblingFails.complete(Unit)
                Cut.STOP -> stop.complete(Unit)
                Cut.STOP_FAILS -> stop.completeExceptionally(Failure())
                Cut.NOTHING,
                Cut.COLLECTOR_FAILS,
                Cut.TAKE -> {}
            }
        }

        /** Returns whether the session was cancelled. */
        fun check(collection: Deferred<Unit>): Boolean {
            val count = heard.size
            fake.advanceBy(LONGER_THAN_A_SESSION_MS)
            assertEquals(name, count, heard.size)
            assertTrue(name, collection.isCompleted)
            assertFalse(name, fake.isRunning)
            val starts = counted.starts.get()
            // A recognizer that is closed on one thread while another delivers keeps its end.
            val isSilenced = counted.ends.get() == 0 && counted.cancels.get() == 1
            val wasCancelled = counted.lastError == SpeechError.CANCELED || isSilenced
            assertTrue(name, starts <= 1)
            assertEquals(name, if (isSilenced) 0 else starts, counted.ends.get())
            assertEquals(name, starts, counted.closes.get())
            assertTrue(name, counted.stops.get() <= 1)
            checkOutcome(collection, wasCancelled)
            fake.close()
            return wasCancelled
        }

        private fun checkOutcome(collection: Deferred<Unit>, wasCancelled: Boolean) {
            val hasResults = heard.lastOrNull() is RecognitionEvent.Results
            when (val outcome = collection.getFailure()) {
                null -> assertTrue(name, hasResults || cut == Cut.TAKE)
                is RecognitionException -> {
                    assertFalse(name, hasResults || wasCancelled)
                    assertEquals(name, counted.lastError, outcome.error)
                }
                is Failure ->
                    assertTrue(
                        name,
                        cut == Cut.COLLECTOR_FAILS ||
                            cut == Cut.SIBLING_FAILS ||
                            cut == Cut.STOP_FAILS,
                    )
                is CancellationException ->
                    assertTrue(name, cut == Cut.CANCEL || cut == Cut.CANCEL_SCOPE)
                else -> throw AssertionError(name, outcome)
            }
        }
    }

    @Test
    fun `a session is cut short at a random step`() {
        var cancelled = 0
        for (seed in 0 until RUNS) {
            val run = Run(seed)
            val scheduler = TestCoroutineScheduler()
            val scope = CoroutineScope(SupervisorJob() + StandardTestDispatcher(scheduler))
            val collection = scope.async { run.collectBesideSibling() }
            val cutAt = run.random.nextInt(30)
            for (step in 0 until 40) {
                if (step == cutAt) {
                    run.cut(scope, collection)
                }
                if (run.random.nextBoolean()) {
                    scheduler.runCurrent()
                } else {
                    run.fake.advanceBy(run.random.nextLong(200))
                }
            }
            scheduler.runCurrent()
            run.fake.advanceBy(LONGER_THAN_A_SESSION_MS)
            scheduler.runCurrent()
            val wasCancelled = run.check(collection)
            assertEquals(run.name, run.counted.starts.get(), run.counted.ends.get())
            assertEquals(run.name, 0, run.counted.eventsAfterClose.get())
            assertEquals(run.name, if (wasCancelled) 1 else 0, run.counted.cancels.get())
            cancelled += if (wasCancelled) 1 else 0
        }
        assertTrue("only $cancelled cancelled", cancelled > RUNS / 5)
    }

    @Test
    fun `a session is cut short on another thread`() {
        var cancelled = 0
        for (seed in 0 until RUNS) {
            val run = Run(seed)
            val scope = CoroutineScope(SupervisorJob() + Dispatchers.Default)
            val collection = scope.async { run.collectBesideSibling() }
            val pauses = run.random.nextInt(200)
            CoroutineScope(Dispatchers.Default).launch {
                repeat(pauses) { yield() }
                run.cut(scope, collection)
            }
            val deadline = System.nanoTime() + TimeUnit.SECONDS.toNanos(PATIENCE_S)
            while (!collection.isCompleted) {
                run.fake.advanceBy(run.random.nextLong(10))
                assertTrue(run.name, System.nanoTime() < deadline)
            }
            // A cancellation may meet the end of the session: it has no effect then.
            val wasCancelled = run.check(collection)
            assertTrue(run.name, run.counted.cancels.get() in (if (wasCancelled) 1..1 else 0..1))
            cancelled += if (wasCancelled) 1 else 0
        }
        assertTrue("only $cancelled cancelled", cancelled > 0)
    }
}

/** Why a completed collection failed; null if it did not. */
private fun Deferred<Unit>.getFailure(): Throwable? {
    @OptIn(kotlinx.coroutines.ExperimentalCoroutinesApi::class)
    return getCompletionExceptionOrNull()
}

private fun makeScript(random: Random): Script {
    val script = Script.cloud().after(random.nextLong(300)).recordingBegin()
    repeat(random.nextInt(3)) {
        script.level(random.nextFloat() * 60).buffer(ByteArray(2)).after(random.nextLong(200))
    }
    script.speakingBegin().after(random.nextLong(900)).recordingDone().after(random.nextLong(500))
    return when (random.nextInt(3)) {
        0 -> script.error(SpeechError.NETWORK).build()
        else -> script.results(RecognitionBuilder.accepted("go forward")).build()
    }
}
