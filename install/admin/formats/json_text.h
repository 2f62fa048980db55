// JSON for what programs read. Texts are UTF-8; a lone surrogate, which UTF-8 cannot represent, is written as its
// escape.
#pragma once

#include <concepts>
#include <string>
#include <string_view>
#include <vector>

namespace kz7 {

// Writes a document piece by piece. Objects in an array begin on lines of their own.
class JsonWriter {
public:
    // The next value belongs to the field `name` of the open object. The names are ours and plain.
    JsonWriter& field(std::string_view name);

    JsonWriter& beginObject() { return open('{', '}'); }
    JsonWriter& beginArray() { return open('[', ']'); }
    JsonWriter& end();

    JsonWriter& text(std::string_view text);

    // A value that is JSON already.
    JsonWriter& raw(std::string_view json);

    JsonWriter& field(std::string_view name, std::string_view value) { return field(name).text(value); }
    JsonWriter& field(std::string_view name, const char* value) { return field(name).text(value); }
    JsonWriter& field(std::string_view name, bool value) { return field(name).raw(value ? "true" : "false"); }
    JsonWriter& field(std::string_view name, std::unsigned_integral auto value) {
        return field(name).raw(std::to_string(value));
    }
    JsonWriter& field(std::string_view name, const std::vector<std::string>& values);

    // What was written since the last call, with a line end behind a whole document.
    std::string take();

private:
    JsonWriter& open(char begin, char end);
    void beginValue(bool isObject);

    std::string json_;
    std::string ends_;     // of what is open
    bool isFirst_ = true;  // of the innermost array or object
    bool afterField_ = false;
};

// The beginning of each document: an object with the version of its format.
JsonWriter beginDocument();

}  // namespace kz7
