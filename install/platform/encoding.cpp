#include "install/platform/encoding.h"

#include <array>

namespace kz7 {

char32_t takeUtf16(std::u16string_view& text) {
    const char32_t first = text[0];
    if (first >= 0xD800 && first <= 0xDBFF && text.size() > 1 && text[1] >= 0xDC00 && text[1] <= 0xDFFF) {
        const char32_t second = text[1];
        text.remove_prefix(2);
        return 0x10000 + ((first - 0xD800) << 10) + (second - 0xDC00);
    }
    text.remove_prefix(1);
    return first;
}

bool takeUtf8(std::string_view& text, char32_t& character) {
    struct Form {
        unsigned mask, lead;  // of the first byte
        char32_t least;       // a smaller character has a shorter form
    };
    static constexpr std::array<Form, 4> kForms = {
        {{0x80, 0x00, 0}, {0xE0, 0xC0, 0x80}, {0xF0, 0xE0, 0x800}, {0xF8, 0xF0, 0x10000}}};
    const auto byteAt = [&](std::size_t at) { return static_cast<unsigned>(static_cast<unsigned char>(text[at])); };
    for (std::size_t more = 0; more < kForms.size() && more < text.size(); ++more) {
        if ((byteAt(0) & kForms[more].mask) != kForms[more].lead) {
            continue;
        }
        char32_t taken = byteAt(0) & ~kForms[more].mask;
        for (std::size_t at = 1; at <= more; ++at) {
            if ((byteAt(at) & 0xC0) != 0x80) {
                return false;
            }
            taken = taken << 6 | (byteAt(at) & 0x3F);
        }
        if (taken < kForms[more].least || taken > 0x10FFFF) {
            return false;
        }
        character = taken;
        text.remove_prefix(more + 1);
        return true;
    }
    return false;
}

void appendUtf16(std::u16string& text, char32_t character) {
    if (character < 0x10000) {
        text += static_cast<char16_t>(character);
        return;
    }
    text += static_cast<char16_t>(0xD800 + ((character - 0x10000) >> 10));
    text += static_cast<char16_t>(0xDC00 + ((character - 0x10000) & 0x3FF));
}

void appendUtf8(std::string& text, char32_t character) {
    const int more = character < 0x80      ? 0
                     : character < 0x800   ? 1
                     : character < 0x10000 ? 2
                                           : 3;  // bytes after the first
    static constexpr std::array<char32_t, 4> kLeads = {0x00, 0xC0, 0xE0, 0xF0};
    text += static_cast<char>(kLeads[static_cast<std::size_t>(more)] | character >> 6 * more);
    for (int left = more - 1; left >= 0; --left) {
        text += static_cast<char>(0x80 | (character >> 6 * left & 0x3F));
    }
}

bool utf16FromUtf8(std::string_view utf8, std::u16string& utf16) {
    std::u16string taken;
    taken.reserve(utf8.size());
    for (char32_t character = 0; !utf8.empty();) {
        if (!takeUtf8(utf8, character)) {
            return false;
        }
        appendUtf16(taken, character);
    }
    utf16 = std::move(taken);
    return true;
}

std::string utf8FromUtf16(std::u16string_view utf16) {
    std::string utf8;
    utf8.reserve(utf16.size());
    while (!utf16.empty()) {
        appendUtf8(utf8, takeUtf16(utf16));
    }
    return utf8;
}

std::string bytesFromUtf16(std::u16string_view utf16) {
    std::string bytes;
    bytes.reserve(2 * utf16.size());
    for (const char16_t unit : utf16) {
        bytes += static_cast<char>(unit & 0xFF);
        bytes += static_cast<char>(unit >> 8);
    }
    return bytes;
}

std::u16string utf16FromBytes(std::string_view bytes) {
    std::u16string utf16;
    utf16.reserve(bytes.size() / 2);
    for (std::size_t at = 0; at + 1 < bytes.size(); at += 2) {
        utf16 += static_cast<char16_t>(static_cast<unsigned char>(bytes[at]) | static_cast<unsigned char>(bytes[at + 1])
                                                                                   << 8);
    }
    return utf16;
}

}  // namespace kz7
