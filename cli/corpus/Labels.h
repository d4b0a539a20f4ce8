#pragma once

#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

namespace Cli {

/** A stretch of sound that holds speech, in milliseconds from the sound's beginning. */
struct Label {
    int64_t startMs = 0;
    int64_t endMs = 0;
    std::string text;
};

/** The text of a label that marks a sound without speech; such labels are not returned. */
extern const char* const NOISE_LABEL;

/** A label file that cannot be used; the text begins with "FILE:LINE: ". */
class LabelError : public std::runtime_error {
  public:
    explicit LabelError(const std::string& text) : std::runtime_error(text) {}
};

/**
 * Reads the labels of one sound in the form that Audacity exports: a line per label with start and
 * end in seconds and a text, separated by tabs. Times are rounded to milliseconds. Lines that begin
 * with a backslash (frequency ranges) and empty lines are skipped.
 * @param path    also the FILE of error texts
 * @param soundMs length of the sound; a label may end up to 10 ms behind it
 * @return the stretches of speech in order; none if all labels are `NOISE_LABEL`
 * @throws LabelError if the file cannot be read, has no label, or one is malformed, has no length,
 *         overlaps the one before or lies outside the sound
 */
std::vector<Label> readLabels(const std::string& path, int64_t soundMs);

/** The text of a label file; without speech, one `NOISE_LABEL` over the whole sound. */
std::string labelText(const std::vector<Label>& speech, int64_t soundMs);

}  // namespace Cli
