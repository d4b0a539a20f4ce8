package org.example.dictation

import korvel.talvox.Outcome
import korvel.talvox.Recognition
import korvel.talvox.TalvoxEngine
import korvel.talvox.TalvoxSettings
import korvel.talvox.ktx.RecognitionEvent.RecordingBegin
import korvel.talvox.ktx.RecognitionEvent.RecordingDone
import korvel.talvox.ktx.RecognitionEvent.Results
import korvel.talvox.ktx.RecognitionException
import korvel.talvox.ktx.recognize
import kotlinx.coroutines.CoroutineScope
import kotlinx.coroutines.Job
import kotlinx.coroutines.cancelAndJoin
import kotlinx.coroutines.flow.MutableStateFlow
import kotlinx.coroutines.launch

class Dictation(private val engine: TalvoxEngine, private val scope: CoroutineScope) {
    val text = MutableStateFlow("Touch and speak")
    private var listening: Job? = null

    fun listen() {
        val earlier = listening
        listening = scope.launch {
            earlier?.cancelAndJoin() // the engine is free when this returns
            try {
                engine.recognize(SETTINGS).collect { event ->
                    when (event) {
                        RecordingBegin -> text.value = "Speak now"
                        RecordingDone -> text.value = "..."
                        is Results -> text.value = describe(event.recognition)
                        else -> {}
                    }
                }
            } catch (failure: RecognitionException) {
                text.value = "That did not work: ${failure.error}"
            }
        }
    }

    private fun describe(recognition: Recognition): String {
        val best = recognition.hypotheses.firstOrNull()
        // Without confidences, two hypotheses or more count as rejected.
        val isRejected = recognition.outcome == Outcome.REJECTED && best?.hasConfidence() == true
        return if (best == null || isRejected) "Please say it again" else best.text
    }

    private companion object {
        val SETTINGS: TalvoxSettings =
            TalvoxSettings.forRecognition().set(TalvoxSettings.LANGUAGE, "en-US").build()
    }
}
