/**
 * @file
 * What the application is told on its command line.
 */
#pragma once

#include <map>
#include <string>

namespace TearDown {

/** Words of the form KEY=VALUE; a missing key counts as empty. */
class Options {
  public:
    Options(int argc, char** argv) {
        for (int i = 1; i < argc; ++i) {
            const std::string word(argv[i]);
            const std::string::size_type sign = word.find('=');
            values[word.substr(0, sign)] =
                sign == std::string::npos ? std::string() : word.substr(sign + 1);
        }
    }

    std::string get(const std::string& key) const {
        const auto found = values.find(key);
        return found == values.end() ? std::string() : found->second;
    }
    bool has(const std::string& key) const { return !get(key).empty(); }

  private:
    std::map<std::string, std::string> values;
};

}  // namespace TearDown
