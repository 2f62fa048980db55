#include "install/admin/formats/json_text.h"

#include <utility>

#include "install/platform/encoding.h"
#include "install/platform/text.h"

namespace kz7 {

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

JsonWriter& JsonWriter::field(std::string_view name) {
    json_ += isFirst_ ? "" : ",";
    appendJsonText(name, json_);
    json_ += ':';
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

JsonWriter& JsonWriter::number(std::uint64_t number) {
    return raw(std::to_string(number));
}

JsonWriter& JsonWriter::raw(std::string_view json) {
    beginValue(false);
    json_ += json;
    return *this;
}

std::string JsonWriter::take() {
    return std::move(json_) + '\n';
}

}  // namespace kz7
