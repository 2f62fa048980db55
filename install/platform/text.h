// Text as the whole system handles it: UTF-8 whose limits count UTF-16 units, the characters of Windows. Case folds in
// ASCII only, fixed buffers cut and always terminate, and only the system's own message texts are ever patterns.
#pragma once

#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <span>
#include <string>
#include <string_view>
#include <variant>

namespace kz7 {

constexpr char foldUpper(char c) {
    return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c;
}

// The text with ASCII letters in upper case; other bytes stay.
std::string foldUpper(std::string_view text);

bool equalsIgnoreCase(std::string_view left, std::string_view right);

// Bytes of a character in UTF-8 at most; one of two units has four bytes.
inline constexpr std::uint32_t kBytesOfCharacter = 3;

// The characters of a text. A byte that is part of none counts as one.
std::size_t textLength(std::string_view text);

// Whether a text has at most that many characters.
inline bool fitsCharacters(std::string_view text, std::size_t limit) {
    return text.size() <= limit || textLength(text) <= limit;
}

// The text up to that many characters; one of two units is taken whole or not at all.
std::string_view cutText(std::string_view text, std::size_t limit);

// A text kept in room for `Size` characters, its terminator included. What does not fit is cut; the terminator never
// is.
template <std::size_t Size>
class FixedText {
public:
    FixedText() { room_[0] = '\0'; }
    explicit FixedText(std::string_view text) { assign(text); }
    FixedText(const FixedText& other) { assign(other.view()); }
    FixedText& operator=(const FixedText& other) {
        if (this != &other) {
            assign(other.view());
        }
        return *this;
    }

    // False when the text was cut.
    bool assign(std::string_view text) {
        length_ = 0;
        return append(text);
    }
    bool append(std::string_view text) {
        // Only a long text is worth counting.
        const std::string_view taken =
            length_ + text.size() < Size ? text : cutText(text, Size - 1 - textLength(view()));
        if (!taken.empty()) {
            std::memmove(room_ + length_, taken.data(), taken.size());
        }
        length_ += taken.size();
        room_[length_] = '\0';
        return taken.size() == text.size();
    }

    std::string_view view() const { return {room_, length_}; }
    const char* c_str() const { return room_; }
    bool empty() const { return length_ == 0; }

private:
    char room_[kBytesOfCharacter * (Size - 1) + 1];  // written up to the terminator; lines are made of these
    std::size_t length_ = 0;                         // bytes
};

// Takes a character off a text that is not empty and returns the columns that it takes on a terminal: 0 for a combining
// mark, 2 for a wide character of East Asia and for most emoji. A byte that is part of no character takes one.
std::uint32_t takeColumns(std::string_view& text);

std::uint32_t columnsOf(std::string_view text);

// Takes the next line of at most `columns` columns off a text, broken at a blank if it has one; with 0 columns it
// is not broken.
std::string_view takeWrappedLine(std::string_view& text, std::uint32_t columns);

// Appends the last `digits` hexadecimal digits of a number, in lower case.
void appendHex(std::uint64_t number, int digits, std::string& text);

// The value of a placeholder: %s takes a text, %d and %u a number (%d shows it signed, as the
// messages always did with a status).
using Insert = std::variant<std::string_view, std::uint32_t>;

// The pattern with its placeholders replaced in order. Patterns are message texts of this system, never
// foreign text; inserts are not interpreted. "%%" is a percent sign.
std::string compose(std::string_view pattern, std::initializer_list<Insert> inserts);

// The same into room of the caller's, cut to it, without a terminator; the result is the length of the whole.
// A placeholder without an insert comes out empty, an insert without a placeholder is left out.
std::size_t composeInto(char* room, std::size_t size, std::string_view pattern, std::span<const Insert> inserts);

}  // namespace kz7
