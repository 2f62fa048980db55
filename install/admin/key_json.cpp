#include "install/admin/key_json.h"

#include <utility>

#include "install/admin/formats/json_text.h"
#include "install/admin/formats/value_type.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

void appendJsonValue(const KeyValue& value, std::string& json) {
    json += "{\"name\":";
    appendJsonText(value.name, json);
    json += ',';
    appendJsonData(value.type, value.data, json);
    json += '}';
}

void appendJsonKey(const KeyRecord& key, std::string& json) {
    json += "{\"key\":";
    appendJsonText(key.name, json);
    json += ",\"class\":";
    appendJsonText(key.keyClass, json);
    json += ",\"values\":[";
    std::string_view separator = "\n  ";
    for (const KeyValue& value : key.values) {
        json += separator;
        appendJsonValue(value, json);
        separator = ",\n  ";
    }
    json += ']';
    if (key.status != kSuccess) {
        json += compose(",\"error\":%u", {key.status});
    }
    json += '}';
}

}  // namespace

Answer showKeysJson(Admin& admin, const std::string& key) {
    std::string separator = "\n";
    std::string head = "{\"schema\":1,\"store\":";
    appendJsonText(admin.platform().storeName(), head);
    return admin.showKeys(
        key, head + ",\"keys\":[",
        [&](const KeyRecord& record, std::string& json) {
            if (!isBareRoot(record) || record.status != kSuccess) {
                json += std::exchange(separator, ",\n");
                appendJsonKey(record, json);
            }
        },
        "]}\n", Admin::Reading::snapshot);
}

}  // namespace kz7
