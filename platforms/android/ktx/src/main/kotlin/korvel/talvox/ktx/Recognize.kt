package korvel.talvox.ktx

import java.util.concurrent.Executor
import korvel.talvox.ErrorDetail
import korvel.talvox.Recognition
import korvel.talvox.RecognitionListener
import korvel.talvox.SpeechError
import korvel.talvox.TalvoxEngine
import korvel.talvox.TalvoxSettings
import kotlinx.coroutines.CompletableJob
import kotlinx.coroutines.Job
import kotlinx.coroutines.awaitCancellation
import kotlinx.coroutines.channels.Channel
import kotlinx.coroutines.channels.SendChannel
import kotlinx.coroutines.ensureActive
import kotlinx.coroutines.flow.Flow
import kotlinx.coroutines.flow.buffer
import kotlinx.coroutines.flow.channelFlow
import kotlinx.coroutines.flow.filterIsInstance
import kotlinx.coroutines.flow.single
import kotlinx.coroutines.launch
import kotlinx.coroutines.selects.select

/**
 * A recognition as a cold flow: each collection runs one session, from its start to its end.
 *
 * The flow completes after [RecognitionEvent.Results]. A session that ends with an error throws a
 * [RecognitionException] after the events before it. Only one session runs at a time: a second one
 * throws it with [SpeechError.BUSY].
 *
 * **Cancellation.** A session never outlives its collection. Cancelling the collecting coroutine, an
 * exception in the collector, and operators that end the flow early, such as `first`, cancel the
 * session once and close its recognizer before `collect` returns or throws. This happens on the
 * collector's dispatcher; the microphone is released as soon as that runs.
 *
 * **Threads.** Any thread may collect. Events arrive in the collector's context. The collector may
 * take its time: events wait in a buffer without a bound, and none is lost. A session of the cloud
 * recognizer reports at most ten buffers of 3 KB (at 16 kHz) and ten levels a second, for 20 s. A
 * dispatcher that runs at once, such as `Dispatchers.Unconfined`, runs the collector on the engine's
 * event thread, where it must not block.
 *
 * @param settings what differs from the engine's settings, see [TalvoxSettings.forRecognition]
 * @param stopWhen runs in the collector's context while the session runs. When it returns, listening
 *   ends as with [korvel.talvox.TalvoxRecognizer.stop], and the answer to what has been said follows:
 *   `recognize(stopWhen = { buttonReleased.await() })`. Unless given, the engine alone decides when
 *   listening ends. It is cancelled when the session ends; an exception that it throws ends the
 *   session and goes to the collector
 * @throws IllegalArgumentException when the flow is collected, if a setting is of the engine only
 */
public fun TalvoxEngine.recognize(
    settings: TalvoxSettings = TalvoxSettings.forRecognition().build(),
    stopWhen: suspend () -> Unit = { awaitCancellation() },
): Flow<RecognitionEvent> =
    channelFlow {
            // A producer that has been cancelled before it runs would still open the microphone.
            ensureActive()
            val end = Job()
            createRecognizer(settings, Relay(channel, end), Executor(Runnable::run)).use {
                it.start()
                val stop = launch { stopWhen() }
                select {
                    stop.onJoin { it.stop() }
                    end.onJoin {}
                }
                end.join()
                stop.cancel()
            }
        }
        .buffer(Channel.UNLIMITED)

/**
 * Runs one recognition and returns what was recognised. Cancelling the coroutine cancels the session
 * once. Parameters and threads are those of [recognize].
 *
 * @param settings what differs from the engine's settings, see [TalvoxSettings.forRecognition]
 * @param stopWhen ends listening when it returns, see [recognize]
 * @throws RecognitionException if the session ends with an error
 * @throws IllegalArgumentException if a setting is of the engine only
 */
public suspend fun TalvoxEngine.recognizeOnce(
    settings: TalvoxSettings = TalvoxSettings.forRecognition().build(),
    stopWhen: suspend () -> Unit = { awaitCancellation() },
): Recognition =
    recognize(settings, stopWhen)
        .filterIsInstance<RecognitionEvent.Results>()
        .single()
        .recognition

/**
 * Sends a session's events to a channel without a bound, which refuses them only after the collector
 * has gone. An error closes the channel instead of failing its producer, so that the events before it
 * still arrive.
 */
private class Relay(
    private val channel: SendChannel<RecognitionEvent>,
    private val end: CompletableJob,
) : RecognitionListener {
    override fun onRecordingBegin() {
        channel.trySend(RecognitionEvent.RecordingBegin)
    }

    override fun onSpeakingBegin() {
        channel.trySend(RecognitionEvent.SpeakingBegin)
    }

    override fun onRecordingDone() {
        channel.trySend(RecognitionEvent.RecordingDone)
    }

    override fun onBufferReceived(pcm: ByteArray) {
        channel.trySend(RecognitionEvent.BufferReceived(pcm))
    }

    override fun onPowerChanged(level: Float) {
        channel.trySend(RecognitionEvent.PowerChanged(level))
    }

    override fun onResults(recognition: Recognition) {
        channel.trySend(RecognitionEvent.Results(recognition))
        end.complete()
    }

    override fun onError(error: SpeechError, detail: ErrorDetail) {
        channel.close(RecognitionException(error, detail))
        end.complete()
    }
}
