#include "install/admin/formats/json_text.h"

#include <utility>

#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

// A text in quotation marks.
void appendJsonText(std::string_view text, std::string& json) {
    const std::u16string utf16 = utf16FromText(text);
    json += '"';
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const char32_t character = takeUtf16(rest);
        if (character < 0x20 || (character >= 0x7F && character < 0xA0) || isSurrogate(character)) {
            json += "\\u";
            appendHex(character, 4, json);
            continue;
        }
        if (character == '"' || character == '\\') {
            json += '\\';
        }
        appendUtf8(json, character);
    }
    json += '"';
}

}  // namespace

JsonWriter& JsonWriter::field(std::string_view name) {
    json_.append(isFirst_ ? "\"" : ",\"").append(name).append("\":");
    isFirst_ = false;
    afterField_ = true;
    return *this;
}

void JsonWriter::beginValue(bool isObject) {
    if (!afterField_) {
        json_ += isFirst_ ? "" : ",";
        json_ += isObject && !ends_.empty() ? "\n" : "";
    }
    isFirst_ = false;
    afterField_ = false;
}

JsonWriter& JsonWriter::open(char begin, char end) {
    beginValue(begin == '{');
    json_ += begin;
    ends_ += end;
    isFirst_ = true;
    return *this;
}

JsonWriter& JsonWriter::end() {
    json_ += ends_.back();
    ends_.pop_back();
    isFirst_ = false;
    return *this;
}

JsonWriter& JsonWriter::text(std::string_view text) {
    beginValue(false);
    appendJsonText(text, json_);
    return *this;
}

JsonWriter& JsonWriter::raw(std::string_view json) {
    beginValue(false);
    json_ += json;
    return *this;
}

JsonWriter& JsonWriter::field(std::string_view name, const std::vector<std::string>& values) {
    field(name).beginArray();
    for (const std::string& value : values) {
        text(value);
    }
    return end();
}

std::string JsonWriter::take() {
    return std::exchange(json_, {}) + (ends_.empty() ? "\n" : "");
}

JsonWriter beginDocument() {
    JsonWriter json;
    json.beginObject().field("schema", 1U);
    return json;
}

}  // namespace kz7
