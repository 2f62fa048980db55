// Registry-editor text, version 5: the form in which keys leave a store and enter another. Both ways are pure:
// text in, records or changes out, in time and room linear in their input.
//
// A round trip is exact in every byte. What plain text cannot hold travels so: a byte that is no character as
// the lone surrogate U+DC00 + byte, control characters of names likewise, a text that is not one line with one
// terminator as hex(1), and the class of a key as a comment line that other editors pass over.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "install/admin/key_changes.h"
#include "install/admin/key_walk.h"

namespace kz7 {

// The first line of a file, and what each key adds to it; UTF-8, lines end in LF.
std::string regTextHeader();
void appendRegText(const KeyRecord& key, std::string& text);

// Such text as Windows' own editor stores it: UTF-16LE, lines end in CR LF. The mark of byte order is the
// caller's to put first.
inline constexpr std::string_view kUtf16Mark = "\xFF\xFE";
std::string utf16FileText(std::string_view text);

struct TextFault {
    std::uint32_t line = 0;  // from 1
    std::string reason;
};

// Takes a whole file: UTF-8 with or without a mark, or UTF-16LE with one; the older form with the header
// REGEDIT4 in the machine's narrow encoding. False at the first bad line, with nothing given but `fault`.
bool parseRegText(std::string_view file, std::vector<KeyChange>& changes, TextFault& fault);

}  // namespace kz7
