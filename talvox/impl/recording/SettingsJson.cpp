#include "talvox/impl/recording/SettingsJson.h"

#include "talvox/SettingsTable.h"
#include "talvox/impl/recording/JsonObject.h"

namespace Talvox {

namespace {

void add(JsonObject& object, const std::string& key, const Util::Bundle::Elem& value) {
    switch (value.type) {
        case Util::Bundle::BOOLEAN:
            object.addBoolean(key, value.asBoolean());
            break;
        case Util::Bundle::INT:
            object.add(key, value.asInt());
            break;
        case Util::Bundle::FLOAT:
            object.addNumber(key, value.asFloat());
            break;
        case Util::Bundle::LATLON:
            object.addJson(key, "[" + JsonObject::formatNumber(value.latLon.lat) + "," +
                                    JsonObject::formatNumber(value.latLon.lon) + "]");
            break;
        case Util::Bundle::STRING:
            object.addText(key, value.text);
            break;
        case Util::Bundle::BUNDLE:
            break;
    }
}

}  // namespace

std::string makeSettingsJson(const Settings& settings) {
    JsonObject object;
    for (const std::string& key : settings.getKeys()) {
        if (key == Settings::SKS_UUID) {
            const std::size_t size = settings.getUuid().empty() ? 0 : SettingsTable::UUID_BYTES;
            object.addText(key, std::string(size, '0'));
        } else {
            add(object, key, settings.get(key));
        }
    }
    return object.getText();
}

}  // namespace Talvox
