package korvel.talvox.ktx

import java.io.File
import java.util.concurrent.Executor
import java.util.concurrent.atomic.AtomicInteger
import korvel.talvox.ErrorDetail
import korvel.talvox.Recognition
import korvel.talvox.RecognitionListener
import korvel.talvox.RecordingOptions
import korvel.talvox.SpeechError
import korvel.talvox.TalvoxEngine
import korvel.talvox.TalvoxRecognizer
import korvel.talvox.TalvoxSettings
import korvel.talvox.TestKitAccess
import korvel.talvox.impl.EngineBackend
import korvel.talvox.testing.FakeEngine

/** A [FakeEngine] of which a test sees every call and every event of its sessions. */
class CountingEngine(val fake: FakeEngine) {
    val starts = AtomicInteger()
    val stops = AtomicInteger()
    val cancels = AtomicInteger()
    val closes = AtomicInteger()
    val ends = AtomicInteger()
    val eventsAfterClose = AtomicInteger()
    @Volatile var lastError: SpeechError? = null
    val engine: TalvoxEngine = TestKitAccess.makeEngine(Backend())

    private inner class Session(private val events: EngineBackend.Events) :
        RecognitionListener, EngineBackend.Running {
        @Volatile private var isClosed = false
        lateinit var recognizer: TalvoxRecognizer

        private fun count() {
            if (isClosed) {
                eventsAfterClose.incrementAndGet()
            }
        }

        override fun onRecordingBegin() {
            count()
            events.onRecordingBegin()
        }

        override fun onSpeakingBegin() {
            count()
            events.onSpeakingBegin()
        }

        override fun onRecordingDone() {
            count()
            events.onRecordingDone()
        }

        override fun onBufferReceived(pcm: ByteArray) {
            count()
            events.onBufferReceived(pcm)
        }

        override fun onPowerChanged(level: Float) {
            count()
            events.onPowerChanged(level)
        }

        override fun onResults(recognition: Recognition) {
            count()
            ends.incrementAndGet()
            events.onResults(recognition)
        }

        override fun onError(error: SpeechError, detail: ErrorDetail) {
            count()
            ends.incrementAndGet()
            lastError = error
            events.onError(error, detail)
        }

        override fun stop() {
            stops.incrementAndGet()
            recognizer.stop()
        }

        override fun cancel() {
            cancels.incrementAndGet()
            recognizer.cancel()
        }

        override fun close() {
            closes.incrementAndGet()
            isClosed = true
            recognizer.close()
        }
    }

    private inner class Backend : EngineBackend {
        override fun start(
            settings: TalvoxSettings,
            recording: RecordingOptions,
            events: EngineBackend.Events,
        ): EngineBackend.Running {
            starts.incrementAndGet()
            val session = Session(events)
            session.recognizer =
                fake.engine.createRecognizer(
                    settings, recording, session, Executor(Runnable::run))
            session.recognizer.start()
            return session
        }

        override fun getVersion(): String = fake.engine.version

        override fun getSettings(): TalvoxSettings = fake.engine.settings

        override fun updateSettings(changes: TalvoxSettings) = fake.engine.updateSettings(changes)

        override fun updateSettingsFromXml(xml: String) = fake.engine.updateSettingsFromXml(xml)

        override fun setCertificateFile(file: File?) = fake.engine.setCertificateFile(file)

        override fun isRecognitionAvailable(settings: TalvoxSettings): Boolean =
            fake.engine.isRecognitionAvailable(settings)

        override fun getAvailableLanguages(): List<String> = fake.engine.availableLanguages

        override fun getMainExecutor(): Executor = Executor(Runnable::run)
    }
}
