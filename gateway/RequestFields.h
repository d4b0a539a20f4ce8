#pragma once

#include <cstddef>
#include <map>
#include <string>

namespace Gateway {

/** The form fields of a request other than its sound, as they arrive and as they are checked. */
class RequestFields {
  public:
    static constexpr std::size_t MAX_VALUE_BYTES = 4096;
    static constexpr std::size_t MAX_TRANSCRIPTS_BYTES = std::size_t{1024} * 1024;

    /** Opens a field. @return an empty text, or why the request is refused, as all below */
    std::string begin(const std::string& name);

    /** Appends to the open field. */
    std::string append(const char* data, std::size_t size);

    /** Closes the open field and checks its value. */
    std::string end();

    bool has(const std::string& name) const { return values.count(name) != 0; }

    /** The value, empty when the field is missing. */
    const std::string& get(const std::string& name) const;

    /** Tells which of the fields that every request carries is missing. */
    std::string findMissing() const;

  private:
    std::map<std::string, std::string> values;
    std::string open;
};

}  // namespace Gateway
