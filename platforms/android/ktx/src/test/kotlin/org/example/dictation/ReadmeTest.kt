package org.example.dictation

import java.io.File
import korvel.talvox.Outcome
import korvel.talvox.SpeechError
import korvel.talvox.ktx.recognizeOnce
import korvel.talvox.testing.FakeEngine
import korvel.talvox.testing.RecognitionBuilder
import korvel.talvox.testing.Script
import kotlinx.coroutines.CompletableDeferred
import kotlinx.coroutines.async
import kotlinx.coroutines.test.TestScope
import kotlinx.coroutines.test.runCurrent
import kotlinx.coroutines.test.runTest
import org.junit.After
import org.junit.Assert.assertEquals
import org.junit.Assert.assertTrue
import org.junit.Test

/** The README's Kotlin is the code beside this test, and does what the README says. */
@OptIn(kotlinx.coroutines.ExperimentalCoroutinesApi::class)
class ReadmeTest {
    private val fake = FakeEngine()
    private val root = File(System.getProperty("talvox.root"))
    private val readme = root.resolve("README.md").readText()

    @After
    fun closeEngine() {
        fake.close()
    }

    private fun listening() = Script.cloud().recordingBegin().speakingBegin().after(500)

    private fun TestScope.finish() {
        runCurrent()
        fake.finish()
        runCurrent()
    }

    @Test
    fun `the class is the one in the README`() {
        val source = "platforms/android/ktx/src/test/kotlin/org/example/dictation/Dictation.kt"
        val shown = readme.substringAfter("```kotlin\nclass Dictation").substringBefore("```")
        assertTrue(shown.length < readme.length)
        assertTrue(root.resolve(source).readText().endsWith("class Dictation$shown"))
    }

    @Test
    fun `the README names the artefact in the project's version`() {
        val version =
            Regex("project\\(KorvelTalvox VERSION ([0-9.]+)")
                .find(root.resolve("CMakeLists.txt").readText())!!
                .groupValues[1]
        assertTrue(readme.contains("implementation(\"org.korvel:talvox-ktx:$version\")"))
    }

    @Test
    fun `the class shows the phases, the answer and the error`() = runTest {
        val dictation = Dictation(fake.engine, backgroundScope)
        fake.play(listening().recordingDone().results(RecognitionBuilder.accepted("go")).build())
        dictation.listen()
        runCurrent()
        assertEquals("Speak now", dictation.text.value)
        finish()
        assertEquals("go", dictation.text.value)
        fake.play(listening().error(SpeechError.NETWORK).build())
        dictation.listen()
        finish()
        assertEquals("That did not work: NETWORK", dictation.text.value)
        val doubtful = RecognitionBuilder(Outcome.REJECTED).hypothesis("no", 0.1f).build()
        fake.play(listening().recordingDone().results(doubtful).build())
        dictation.listen()
        finish()
        assertEquals("Please say it again", dictation.text.value)
    }

    @Test
    fun `listening again ends the earlier session first`() = runTest {
        val dictation = Dictation(fake.engine, backgroundScope)
        repeat(2) {
            fake.play(listening().recordingDone().results(RecognitionBuilder.empty()).build())
            dictation.listen()
            runCurrent()
            assertEquals("Speak now", dictation.text.value)
        }
        assertEquals(2, fake.startCount)
        finish()
        assertEquals("Please say it again", dictation.text.value)
    }

    @Test
    fun `one answer, ended by a button`() = runTest {
        fake.play(
            listening().recordingDone().results(RecognitionBuilder.accepted("go forward")).build()
        )
        val engine = fake.engine
        val buttonReleased = CompletableDeferred<Unit>()
        val text = async {
            val recognition = engine.recognizeOnce(stopWhen = { buttonReleased.await() })
            recognition.hypotheses.firstOrNull()?.text
        }
        runCurrent()
        fake.advanceBy(200)
        buttonReleased.complete(Unit)
        finish()
        assertEquals("go forward", text.await())
        val source = root.resolve("platforms/android/ktx/src/test/kotlin/org/example/dictation")
        val lines = readme.substringAfter("```kotlin\nval recognition").substringBefore("```")
        val test = source.resolve("ReadmeTest.kt").readLines().map { it.trim() }
        assertTrue("val recognition$lines".trim().lines().all { it in test })
    }
}
