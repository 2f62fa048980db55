// Registry-editor text, version 5, in which keys move between stores. Time and memory are linear in the input.
//
// A round trip preserves every byte. A byte that is not part of a character is written as the lone surrogate
// U+DC00 + byte, as are control characters in names; a text that is not one line with one terminator as hex(1); the
// class of a key as a comment, which other editors ignore.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "install/src/registry/key_changes.h"
#include "install/src/registry/key_walk.h"

namespace kz7 {

// The first line of a file and the lines of keys, values and their removals: UTF-8 with LF. Values belong to the key
// before them.
std::string regTextHeader();
void appendRegKey(std::string_view name, std::string_view keyClass, std::string& text);
void appendRegValue(const KeyValue& value, std::string& text);
void appendRegKeyRemoval(std::string_view name, std::string& text);
void appendRegValueRemoval(std::string_view name, std::string& text);

// A key with its values.
void appendRegText(const KeyRecord& key, std::string& text);

// Converts such text to the form of Windows' own editor: UTF-16LE with CR LF. The caller writes the byte order mark.
inline constexpr std::string_view kUtf16Mark = "\xFF\xFE";
std::string utf16FileText(std::string_view text);

struct TextFault {
    std::uint32_t line = 0;  // from 1
    std::string reason;
};

// Parses a whole file: UTF-8 with or without a byte order mark, or UTF-16LE with one; the older form with the header
// REGEDIT4 in the machine's narrow encoding. False at the first bad line; only `fault` is then set.
bool parseRegText(std::string_view file, std::vector<KeyChange>& changes, TextFault& fault);

}  // namespace kz7
