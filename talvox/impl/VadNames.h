/**
 * @file
 * The names of the "vad" setting, as `VadParameterText` normalises them: lower case without "_" and
 * blanks.
 */
#pragma once

namespace Talvox::VadNames {

inline constexpr char ENGINE[] = "engine";
inline constexpr char SUBENGINE[] = "subengine";
inline constexpr char ANALYZE_MS_ON[] = "analyzemson";
inline constexpr char ACTIVITY_ON[] = "activityon";
inline constexpr char ANALYZE_MS_OFF[] = "analyzemsoff";
/** Another name of `ANALYZE_MS_OFF`. */
inline constexpr char ANALYZE_MS[] = "analyzems";
inline constexpr char ACTIVITY_OFF[] = "activityoff";
inline constexpr char MIN_VOICE_TIME_MS[] = "minvoicetimems";
inline constexpr char FRAME_MS[] = "framems";
inline constexpr char AGGRESSIVENESS[] = "aggressiveness";
inline constexpr char INDIVIDUAL[] = "individual";
inline constexpr char TOTAL[] = "total";
inline constexpr char OVERHANG_MAX_1[] = "overhangmax1";
inline constexpr char OVERHANG_MAX_2[] = "overhangmax2";
inline constexpr char VERBOSE_LOG[] = "verboselog";

/** Values of `ENGINE`. */
inline constexpr char BUFFERED[] = "buffered";
/** Value of `ENGINE` and of `SUBENGINE`. */
inline constexpr char WEBRTC[] = "wrtc";

}  // namespace Talvox::VadNames
