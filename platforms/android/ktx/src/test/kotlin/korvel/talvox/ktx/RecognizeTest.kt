package korvel.talvox.ktx

import java.util.concurrent.Executors
import korvel.talvox.RecorderState
import korvel.talvox.SpeechError
import korvel.talvox.TalvoxSettings
import korvel.talvox.ktx.RecognitionEvent.BufferReceived
import korvel.talvox.ktx.RecognitionEvent.PowerChanged
import korvel.talvox.ktx.RecognitionEvent.RecordingBegin
import korvel.talvox.ktx.RecognitionEvent.RecordingDone
import korvel.talvox.ktx.RecognitionEvent.Results
import korvel.talvox.ktx.RecognitionEvent.SpeakingBegin
import korvel.talvox.testing.ErrorDetailBuilder
import korvel.talvox.testing.FakeEngine
import korvel.talvox.testing.RecognitionBuilder
import korvel.talvox.testing.Script
import kotlinx.coroutines.CompletableDeferred
import kotlinx.coroutines.CoroutineStart
import kotlinx.coroutines.Dispatchers
import kotlinx.coroutines.NonCancellable
import kotlinx.coroutines.asCoroutineDispatcher
import kotlinx.coroutines.async
import kotlinx.coroutines.cancelAndJoin
import kotlinx.coroutines.flow.Flow
import kotlinx.coroutines.flow.buffer
import kotlinx.coroutines.flow.first
import kotlinx.coroutines.flow.flowOn
import kotlinx.coroutines.flow.toList
import kotlinx.coroutines.launch
import kotlinx.coroutines.runBlocking
import kotlinx.coroutines.supervisorScope
import kotlinx.coroutines.test.TestScope
import kotlinx.coroutines.test.runCurrent
import kotlinx.coroutines.test.runTest
import kotlinx.coroutines.withContext
import org.junit.After
import org.junit.Assert.assertArrayEquals
import org.junit.Assert.assertEquals
import org.junit.Assert.assertFalse
import org.junit.Assert.assertSame
import org.junit.Assert.assertThrows
import org.junit.Assert.assertTrue
import org.junit.Test

/** What the flow delivers, how it ends, and what becomes of the session then. */
@OptIn(kotlinx.coroutines.ExperimentalCoroutinesApi::class)
class RecognizeTest {
    private val fake = FakeEngine()
    private val counted = CountingEngine(fake)
    private val engine = counted.engine
    private val results = RecognitionBuilder.accepted("go forward")
    private val heard = mutableListOf<RecognitionEvent>()

    @After
    fun closeEngine() {
        assertEquals("recognizers closed", counted.starts.get(), counted.closes.get())
        fake.close()
    }

    private fun playWhole() {
        fake.play(
            Script.cloud()
                .after(300)
                .recordingBegin()
                .level(45f)
                .buffer(byteArrayOf(1, 2))
                .after(200)
                .speakingBegin()
                .after(900)
                .recordingDone()
                .after(100)
                .results(results)
                .build()
        )
    }

    private fun playNetworkError() {
        val detail =
            ErrorDetailBuilder()
                .reason("HTTP status 503 (the service is busy)")
                .httpStatus(503)
                .recorderState(RecorderState.RECORDING)
                .build()
        fake.play(Script.cloud().after(300).recordingBegin().after(50).error(SpeechError.NETWORK, detail).build())
    }

    /** Collects in the background and lets it start. */
    private fun TestScope.collect(events: Flow<RecognitionEvent>) =
        backgroundScope.async(start = CoroutineStart.LAZY) { events.collect { heard += it } }.also {
            it.start()
            runCurrent()
        }

    private fun TestScope.advanceBy(durationMs: Long) {
        fake.advanceBy(durationMs)
        runCurrent()
    }

    @Test
    fun `a flow delivers all events in order and completes after the results`() = runTest {
        playWhole()
        val collection = collect(engine.recognize())
        advanceBy(300)
        assertEquals(listOf(RecordingBegin, PowerChanged(45f)), heard.take(2))
        assertArrayEquals(byteArrayOf(1, 2), (heard[2] as BufferReceived).pcm)
        advanceBy(1_199)
        assertFalse(collection.isCompleted)
        advanceBy(1)
        collection.await()
        assertEquals(listOf(SpeakingBegin, RecordingDone, Results(results)), heard.drop(3))
        assertEquals(0, counted.cancels.get())
    }

    @Test
    fun `a flow is cold and runs one session for each collection`() = runTest {
        playWhole()
        playWhole()
        val events = engine.recognize()
        assertEquals(0, fake.startCount)
        repeat(2) {
            val collection = collect(events)
            fake.finish()
            collection.await()
        }
        assertEquals(2, fake.startCount)
        assertEquals(12, heard.size)
    }

    @Test
    fun `an error arrives as an exception after the events before it`() = runTest {
        playNetworkError()
        supervisorScope {
            val collection = async { engine.recognize().collect { heard += it } }
            runCurrent()
            fake.finish()
            val thrown = runCatching { collection.await() }.exceptionOrNull() as RecognitionException
            assertEquals(SpeechError.NETWORK, thrown.error)
            assertEquals(503, thrown.detail.httpStatus)
            assertEquals(RecorderState.RECORDING, thrown.detail.recorderState)
            assertEquals(
                "ErrorNetwork: HTTP status 503 (the service is busy), HTTP status 503, " +
                    "recorder RECORDING",
                thrown.message,
            )
        }
        assertEquals(listOf(RecordingBegin), heard)
        assertEquals(0, counted.cancels.get())
    }

    @Test
    fun `recognizeOnce returns the recognition`() = runTest {
        playWhole()
        val answer = async { engine.recognizeOnce() }
        runCurrent()
        fake.finish()
        assertSame(results, answer.await())
    }

    @Test
    fun `recognizeOnce throws the error`() = runTest {
        fake.play(Script.cloud().recordingBegin().error(SpeechError.AUDIO).build())
        supervisorScope {
            val answer = async { engine.recognizeOnce() }
            runCurrent()
            fake.finish()
            val thrown = runCatching { answer.await() }.exceptionOrNull() as RecognitionException
            assertEquals(SpeechError.AUDIO, thrown.error)
        }
    }

    @Test
    fun `the settings reach the session`() = runTest {
        playWhole()
        val settings =
            TalvoxSettings.forRecognition().set(TalvoxSettings.LANGUAGE, "en-US").build()
        val answer = async { engine.recognizeOnce(settings) }
        runCurrent()
        assertEquals(settings, fake.sessionSettings)
        fake.finish()
        answer.await()
    }

    @Test
    fun `settings of the engine are refused when the flow is collected`() {
        val settings =
            TalvoxSettings.builder().set(TalvoxSettings.STREAMING, true).build()
        val events = engine.recognize(settings)
        assertThrows(IllegalArgumentException::class.java) { runBlocking { events.first() } }
        assertEquals(0, fake.startCount)
    }

    @Test
    fun `cancelling ends the session before join returns`() = runTest {
        playWhole()
        val collection = collect(engine.recognize())
        advanceBy(400)
        val before = heard.size
        collection.cancelAndJoin()
        assertFalse(fake.isRunning)
        assertEquals(1, counted.cancels.get())
        advanceBy(2_000)
        assertEquals(before, heard.size)
    }

    @Test
    fun `a coroutine that is cancelled before it starts opens no microphone`() = runTest {
        playWhole()
        val collection =
            launch(start = CoroutineStart.UNDISPATCHED) { engine.recognize().collect {} }
        collection.cancelAndJoin()
        assertEquals(0, fake.startCount)
    }

    @Test
    fun `an exception of the collector ends the session`() = runTest {
        playWhole()
        supervisorScope {
            val collection = async { engine.recognize().collect { error("collector") } }
            runCurrent()
            advanceBy(300)
            assertFalse(fake.isRunning)
            assertEquals("collector", runCatching { collection.await() }.exceptionOrNull()?.message)
        }
        assertEquals(1, counted.cancels.get())
    }

    @Test
    fun `an operator that ends the flow ends the session`() = runTest {
        playWhole()
        val first = async { engine.recognize().first() }
        runCurrent()
        fake.advanceBy(300)
        assertEquals(RecordingBegin, first.await())
        assertFalse(fake.isRunning)
        assertEquals(1, counted.cancels.get())
    }

    @Test
    fun `a second session is busy and the first goes on`() = runTest {
        playWhole()
        val first = async { engine.recognizeOnce() }
        runCurrent()
        val second = runCatching { engine.recognizeOnce() }.exceptionOrNull()
        assertEquals(SpeechError.BUSY, (second as RecognitionException).error)
        fake.finish()
        assertSame(results, first.await())
    }

    @Test
    fun `listening ends when stopWhen returns`() = runTest {
        playWhole()
        val released = CompletableDeferred<Unit>()
        val collection = collect(engine.recognize(stopWhen = { released.await() }))
        advanceBy(600)
        released.complete(Unit)
        runCurrent()
        assertEquals(RecordingDone, heard.last())
        assertEquals(1, counted.stops.get())
        advanceBy(100)
        collection.await()
        assertEquals(Results(results), heard.last())
    }

    @Test
    fun `stopWhen is cancelled when the session ends`() = runTest {
        playWhole()
        var isCancelled = false
        val answer = async {
            engine.recognizeOnce(
                stopWhen = {
                    try {
                        CompletableDeferred<Unit>().await()
                    } finally {
                        isCancelled = true
                    }
                }
            )
        }
        runCurrent()
        fake.finish()
        answer.await()
        assertTrue(isCancelled)
        assertEquals(0, counted.stops.get())
    }

    @Test
    fun `the session does not wait for a stopWhen that cannot be cancelled`() = runTest {
        playWhole()
        val released = CompletableDeferred<Unit>()
        val collection =
            collect(
                engine.recognize(stopWhen = { withContext(NonCancellable) { released.await() } })
            )
        advanceBy(600)
        collection.cancel()
        runCurrent()
        assertFalse(fake.isRunning)
        assertEquals(1, counted.closes.get())
        released.complete(Unit)
        collection.join()
        assertEquals(0, counted.stops.get())
    }

    @Test
    fun `an exception of stopWhen ends the session and goes to the collector`() = runTest {
        playWhole()
        val thrown = runCatching { engine.recognizeOnce(stopWhen = { error("stop") }) }
        assertEquals("stop", thrown.exceptionOrNull()?.message)
        assertFalse(fake.isRunning)
    }

    @Test
    fun `a collector that is slow loses nothing however small the buffers behind`() = runTest {
        val script = Script.cloud().recordingBegin()
        val levels = 1_000
        repeat(levels) { script.after(1).level(it.toFloat()) }
        fake.play(script.speakingBegin().recordingDone().results(results).build())
        val events = async { engine.recognize().buffer(1).flowOn(Dispatchers.Unconfined).toList() }
        runCurrent()
        fake.finish()
        val powers = events.await().filterIsInstance<PowerChanged>().map { it.level.toInt() }
        assertEquals((0 until levels).toList(), powers)
    }

    @Test
    fun `events arrive in the collector's context`() {
        playWhole()
        Executors.newSingleThreadExecutor { Thread(it, "collector") }
            .asCoroutineDispatcher()
            .use { dispatcher ->
                runBlocking {
                    val threads = async(dispatcher) {
                        val names = mutableSetOf<String>()
                        engine.recognize().collect {
                            names += Thread.currentThread().name.substringBefore(' ')
                        }
                        names
                    }
                    withContext(dispatcher) {}
                    while (!fake.isRunning) {
                        withContext(dispatcher) {}
                    }
                    fake.finish()
                    assertEquals(setOf("collector"), threads.await())
                }
            }
    }
}
