// Text: UTF-8 whose limits count UTF-16 units, as those of Windows do. Case folds in ASCII only. Fixed buffers truncate
// and always terminate. Only this system's own message texts are patterns.
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

// The most bytes of a UTF-16 unit in UTF-8; a character of two units has four bytes.
inline constexpr std::uint32_t kBytesOfCharacter = 3;

// The UTF-16 units of a text. A byte that is not part of a character counts as one.
std::size_t textLength(std::string_view text);

// Whether a text has at most that many characters.
inline bool fitsCharacters(std::string_view text, std::size_t limit) {
    return text.size() <= limit || textLength(text) <= limit;
}

// The first `limit` characters of a text; a character of two units is never divided.
std::string_view cutText(std::string_view text, std::size_t limit);

// A text of at most `Size` - 1 characters and its terminator. A longer text is truncated.
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

    // False: the text was truncated.
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

// Appends the last `digits` hexadecimal digits of a number, in lower case.
void appendHex(std::uint64_t number, int digits, std::string& text);

// The value of a placeholder: a text for %s, a number for %u and %d; %d shows it as signed.
using Insert = std::variant<std::string_view, std::uint32_t>;

// The pattern with its placeholders replaced in order. Patterns are message texts of this system, never
// foreign text; inserts are not interpreted. "%%" is a percent sign.
std::string compose(std::string_view pattern, std::initializer_list<Insert> inserts);

// The same into a caller's buffer, truncated, without a terminator; returns the length of the whole text. A placeholder
// without an insert becomes empty; an insert without a placeholder is ignored.
std::size_t composeInto(char* room, std::size_t size, std::string_view pattern, std::span<const Insert> inserts);

// Foreign text for a terminal, with control characters, and characters that change the direction of writing, escaped.
std::string shownText(std::string_view foreign);

}  // namespace kz7
