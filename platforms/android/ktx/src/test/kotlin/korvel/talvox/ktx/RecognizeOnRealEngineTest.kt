package korvel.talvox.ktx

import korvel.talvox.SpeechError
import korvel.talvox.TalvoxRecognizer
import korvel.talvox.TalvoxSettings
import korvel.talvox.support.Connectivity
import korvel.talvox.support.DevelopmentGateway
import korvel.talvox.support.EngineTestCase
import korvel.talvox.support.Events
import korvel.talvox.support.Microphone
import kotlinx.coroutines.Dispatchers
import kotlinx.coroutines.flow.first
import kotlinx.coroutines.flow.onEach
import kotlinx.coroutines.flow.toList
import kotlinx.coroutines.runBlocking
import org.junit.After
import org.junit.Assert.assertEquals
import org.junit.Assert.assertFalse
import org.junit.Assert.assertTrue
import org.junit.Before
import org.junit.Test

/** Recognitions from a coroutine to the gateway and back, by the real library. */
class RecognizeOnRealEngineTest : EngineTestCase() {
    private companion object {
        const val SAMPLE_RATE_HZ = 16_000
        const val SPEED = 4
    }

    private val gateway = DevelopmentGateway()
    private lateinit var microphone: Microphone

    @Before
    fun plugIn() {
        Connectivity.wifi(application)
        microphone = Microphone(SAMPLE_RATE_HZ, SPEED).plugIn()
        useGateway(gateway.url)
    }

    @After
    fun unplug() {
        microphone.close()
        gateway.close()
    }

    /** Says a phrase as soon as the recording has begun, like a user who waits for the sign. */
    private fun speak(event: RecognitionEvent) {
        if (event == RecognitionEvent.RecordingBegin) {
            microphone.say(Microphone.recording("goforward.raw"))
        }
    }

    @Test
    fun `speech is recognised`() = runBlocking {
        val events = engine.recognize().onEach(::speak).toList()
        val heard = events.last() as RecognitionEvent.Results
        val best = heard.recognition.hypotheses.first().text
        assertTrue(best, best.contains("go forward"))
        assertTrue(events.any { it is RecognitionEvent.PowerChanged })
        assertTrue(events.filterIsInstance<RecognitionEvent.BufferReceived>().size > 10)
        assertEquals(
            listOf("RecordingBegin", "SpeakingBegin", "RecordingDone"),
            events.map { it.toString() }.filter { it.matches(Regex("[A-Z][a-z]+(Begin|Done)")) },
        )
    }

    @Test
    fun `a session that ends with an error throws it`() = runBlocking {
        forgetGateway()
        val thrown = runCatching { engine.recognizeOnce() }.exceptionOrNull()
        assertEquals(SpeechError.NETWORK, (thrown as RecognitionException).error)
        assertFalse(thrown.detail.reason.isEmpty())
    }

    /** What has been cancelled leaves the engine free: the next session is not busy. */
    @Test
    fun `a collection that ends early frees the engine`() = runBlocking(Dispatchers.Default) {
        repeat(20) {
            assertEquals(RecognitionEvent.RecordingBegin, engine.recognize().first())
        }
        val events = Events()
        val recognizer: TalvoxRecognizer =
            engine.createRecognizer(TalvoxSettings.forRecognition().build(), events)
        recognizer.use {
            it.start()
            assertEquals("recordingBegin", events.next())
        }
    }
}
