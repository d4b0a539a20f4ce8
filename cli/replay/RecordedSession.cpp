#include "RecordedSession.h"

#include <boost/make_shared.hpp>
#include <fstream>
#include <iterator>
#include <optional>

#include "cli/UsageError.h"
#include "talvox/SettingsTable.h"

namespace Cli {

namespace {

using nlohmann::json;
using Util::Bundle;

constexpr int FORMAT_VERSION = 1;
constexpr std::size_t WAV_HEAD_BYTES = 44;

std::optional<std::string> readFile(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        return std::nullopt;
    }
    return std::string(std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>());
}

std::string readNeededFile(const std::string& folder, const std::string& name) {
    const std::optional<std::string> bytes = readFile(folder + "/" + name);
    if (!bytes) {
        throw UsageError(folder + " is not a recording: it has no readable " + name);
    }
    return *bytes;
}

json parse(const std::string& text, const std::string& where) {
    json value = json::parse(text, nullptr, false);
    if (!value.is_object()) {
        throw UsageError(where + " is not a JSON object");
    }
    return value;
}

// A last line without a line feed is what a killed process left.
std::vector<json> parseLines(const std::string& text, const std::string& file) {
    std::vector<json> lines;
    std::size_t begin = 0;
    for (std::size_t end = text.find('\n'); end != std::string::npos;
         end = text.find('\n', begin)) {
        const std::string where = file + ":" + std::to_string(lines.size() + 1);
        json line = parse(text.substr(begin, end - begin), where);
        if (!line.value("kind", json()).is_string()) {
            throw UsageError(where + " has no kind");
        }
        lines.push_back(std::move(line));
        begin = end + 1;
    }
    return lines;
}

void put(Talvox::Settings& settings, const Talvox::SettingRow& row, const json& value) {
    switch (row.type) {
        case Bundle::BOOLEAN:
            settings.putBoolean(row.key, value.get<bool>());
            break;
        case Bundle::INT:
            settings.putInt(row.key, value.get<int>());
            break;
        case Bundle::FLOAT:
            settings.putFloat(row.key, value.get<float>());
            break;
        case Bundle::LATLON:
            settings.putLatLon(row.key, {value.at(0).get<float>(), value.at(1).get<float>()});
            break;
        case Bundle::STRING:
            settings.putString(row.key, value.get<std::string>());
            break;
        case Bundle::BUNDLE:
            break;
    }
}

}  // namespace

RecordedSession readRecording(const std::string& folder) {
    RecordedSession session(
        parse(readNeededFile(folder, "session.json"), folder + "/session.json"));
    if (session.description.value("format", json()) != FORMAT_VERSION) {
        throw UsageError(folder + " is a recording of another version");
    }
    const std::string events = "events.jsonl";
    session.lines = parseLines(readNeededFile(folder, events), folder + "/" + events);
    if (session.description.value("hasSound", json()) != true) {
        throw UsageError(folder + " cannot be replayed: it was recorded without its sound");
    }
    const std::string wav = readNeededFile(folder, "sound.wav");
    session.sound = wav.size() > WAV_HEAD_BYTES ? wav.substr(WAV_HEAD_BYTES) : std::string();
    return session;
}

boost::shared_ptr<Talvox::Settings> readSettings(const json& settings) {
    auto result = boost::make_shared<Talvox::Settings>();
    for (const Talvox::SettingRow* row = Talvox::SettingsTable::rows; row->key != nullptr; ++row) {
        const auto found = settings.find(row->key);
        if (found == settings.end() || found->is_null()) {
            continue;
        }
        try {
            put(*result, *row, *found);
        } catch (const json::exception&) {
            throw UsageError(std::string("the recording has no usable value for ") + row->key);
        }
    }
    return result;
}

}  // namespace Cli
