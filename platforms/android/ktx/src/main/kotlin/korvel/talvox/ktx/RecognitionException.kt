package korvel.talvox.ktx

import korvel.talvox.ErrorDetail
import korvel.talvox.SpeechError

/**
 * A recognition ended without results. The message names the error and its cause, for developers and
 * logs; do not show it to users.
 *
 * @property error the kind of error
 * @property detail what is known of the cause
 */
public class RecognitionException(
    public val error: SpeechError,
    public val detail: ErrorDetail,
) : Exception("${error.text}: $detail")
