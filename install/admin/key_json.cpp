#include "install/admin/key_json.h"

#include "install/admin/formats/json_text.h"
#include "install/admin/formats/value_type.h"

namespace kz7 {
namespace {

void appendKey(const KeyRecord& key, JsonWriter& json) {
    json.beginObject().field("key", key.name).field("class", key.keyClass).field("values").beginArray();
    for (const KeyValue& value : key.values) {
        appendData(value.type, value.data, json.beginObject().field("name", value.name));
        json.end();
    }
    json.end();
    if (key.status != kSuccess) {
        json.field("error", key.status);
    }
    json.end();
}

}  // namespace

Answer showKeysJson(Admin& admin, const std::string& key) {
    JsonWriter json = beginDocument();
    json.field("store", admin.platform().storeName()).field("keys").beginArray();
    return admin.showKeys(
        key, json.take(),
        [&](const KeyRecord& record, std::string& text) {
            if (!isBareRoot(record) || record.status != kSuccess) {
                appendKey(record, json);
                text += json.take();
            }
        },
        "]}\n", Admin::Reading::snapshot);
}

}  // namespace kz7
