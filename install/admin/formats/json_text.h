// JSON for what programs read. Texts are UTF-8; a lone surrogate, which UTF-8 cannot represent, is written as its
// escape.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace kz7 {

// A text in quotation marks.
void appendJsonText(std::string_view text, std::string& json);

// Writes a document piece by piece. Objects in an array begin on lines of their own.
class JsonWriter {
public:
    // The next value belongs to the field `name` of the open object.
    JsonWriter& field(std::string_view name);

    JsonWriter& beginObject() { return open('{', '}'); }
    JsonWriter& beginArray() { return open('[', ']'); }
    JsonWriter& end();

    JsonWriter& text(std::string_view text);
    JsonWriter& number(std::uint64_t number);
    JsonWriter& boolean(bool value) { return raw(value ? "true" : "false"); }

    // A value that is JSON already.
    JsonWriter& raw(std::string_view json);

    JsonWriter& field(std::string_view name, std::string_view value) { return field(name).text(value); }
    JsonWriter& field(std::string_view name, const char* value) { return field(name).text(value); }
    JsonWriter& field(std::string_view name, bool value) { return field(name).boolean(value); }
    JsonWriter& field(std::string_view name, std::uint64_t value) { return field(name).number(value); }

    // The whole document, with a line end.
    std::string take();

private:
    JsonWriter& open(char begin, char end);
    void beginValue(bool isObject);

    std::string json_;
    std::string ends_;     // of what is open
    bool isFirst_ = true;  // of the innermost array or object
    bool afterField_ = false;
};

}  // namespace kz7
