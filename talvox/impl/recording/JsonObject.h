/**
 * @file
 * Writes one JSON object.
 */
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace Talvox {

/** Builds the text of a JSON object, member by member, in one line. */
class JsonObject {
  public:
    JsonObject& add(std::string_view name, int64_t value);
    JsonObject& addBoolean(std::string_view name, bool value);
    /** A number that is not finite becomes null. */
    JsonObject& addNumber(std::string_view name, float value);
    /** Bytes that are not UTF-8 become U+FFFD. */
    JsonObject& addText(std::string_view name, std::string_view value);
    /** @param json an object or array */
    JsonObject& addJson(std::string_view name, std::string_view json);

    /** The object's text, without a line feed. */
    std::string getText() const { return text.empty() ? "{}" : text + '}'; }

    static std::string formatNumber(float value);

  private:
    void addName(std::string_view name);

    std::string text;
};

}  // namespace Talvox
