#include "install/admin/formats/reg_text.h"

#include <algorithm>
#include <charconv>

#include "install/platform/encoding.h"
#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kHeader = "Windows Registry Editor Version 5.00";
constexpr std::string_view kOldHeader = "REGEDIT4";
constexpr std::string_view kUtf8Mark = "\xEF\xBB\xBF";
constexpr std::string_view kClassComment = ";class=\"";
constexpr std::string_view kBlanks = " \t";
constexpr std::size_t kBytesOfLine = 24;
constexpr char32_t kEscaped = 0xDC00;
constexpr char32_t kShifted = 0x100;

bool isControl(char32_t character) {
    return character < 0x20 || (character >= 0x7F && character < 0xA0);
}

// Whether a character in a name is one that control characters travel as, or marks one that stands for itself.
bool isEscape(char32_t character) {
    return character >= kEscaped && character < kEscaped + 0x80;
}

bool isLeading(char32_t character) {
    return isSurrogate(character) && character < kEscaped;
}

// UTF-8 without ASCII's control characters, which would end a line or steer a terminal. One behind leading surrogates,
// with which its own surrogate would form a pair, travels as U+0100 + character, and a mark is before them.
std::string nameText(std::string_view name) {
    const std::u16string utf16 = utf16FromText(name);
    std::string text;
    std::size_t beforeLeading = std::string::npos;  // the place of that mark
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const char32_t character = takeUtf16(rest);
        const bool isAsciiControl = character < 0x20 || character == 0x7F;
        if (isLeading(character)) {
            beforeLeading = std::min(beforeLeading, text.size());
            appendUtf8(text, character);
            continue;
        }
        if (isAsciiControl && beforeLeading != std::string::npos) {
            std::string mark;
            appendUtf8(mark, kEscaped);
            text.insert(beforeLeading, mark);
            appendUtf8(text, kShifted + character);
        } else {
            if (isEscape(character)) {
                appendUtf8(text, kEscaped);
            }
            appendUtf8(text, isAsciiControl ? kEscaped + character : character);
        }
        beforeLeading = std::string::npos;
    }
    return text;
}

void appendQuoted(std::string_view utf8, std::string& text) {
    text += '"';
    for (const char c : utf8) {
        if (c == '"' || c == '\\') {
            text += '\\';
        }
        text += c;
    }
    text += '"';
}

// Whether the value is one line with one terminator; `utf8` is that line.
bool isPlainText(const KeyValue& value, std::string& utf8) {
    if (value.type != ValueType::sz || value.data.empty() || value.data.back() != '\0') {
        return false;
    }
    const std::u16string utf16 = utf16FromText(std::string_view(value.data).substr(0, value.data.size() - 1));
    for (std::u16string_view rest = utf16; !rest.empty();) {
        const char32_t character = takeUtf16(rest);
        if (isControl(character) || isSurrogate(character)) {
            return false;
        }
    }
    utf8 = utf8FromUtf16(utf16);
    return true;
}

void appendHexType(ValueType type, std::string& text) {
    text += "hex";
    if (type != ValueType::binary) {
        char digits[8];
        const auto end = std::to_chars(digits, digits + sizeof digits, static_cast<std::uint32_t>(type), 16);
        text.append("(").append(digits, end.ptr).append(")");
    }
    text += ':';
}

void appendData(const KeyValue& value, std::string& text) {
    std::string utf8;
    if (isPlainText(value, utf8)) {
        appendQuoted(utf8, text);
        return;
    }
    if (value.type == ValueType::dword && value.data.size() == 4) {
        text += "dword:";
        for (std::size_t at = 4; at-- > 0;) {
            appendHex(static_cast<unsigned char>(value.data[at]), 2, text);
        }
        return;
    }
    appendHexType(value.type, text);
    const std::string bytes = isTextType(value.type) ? bytesFromUtf16(utf16FromText(value.data)) : value.data;
    for (std::size_t at = 0; at < bytes.size(); ++at) {
        if (at != 0) {
            text += at % kBytesOfLine == 0 ? ",\\\n  " : ",";
        }
        appendHex(static_cast<unsigned char>(bytes[at]), 2, text);
    }
}

void appendValueName(std::string_view name, std::string& text) {
    if (name.empty()) {
        text += '@';
    } else {
        appendQuoted(nameText(name), text);
    }
    text += '=';
}

class Parser {
public:
    Parser(std::vector<KeyChange>& changes, TextFault& fault) : changes_(changes), fault_(fault) {}

    bool run(std::string_view file) {
        if (!decode(file) || !header()) {
            return false;
        }
        while (nextLine()) {
            skipBlanks();
            const bool classLine = line_.starts_with(kClassComment) && atKeyLine_;
            atKeyLine_ = false;
            if (classLine ? !keyClass() : !atEnd() && !(line_.front() == '[' ? key() : value())) {
                return false;
            }
        }
        return true;
    }

private:
    bool fail(std::string_view reason) {
        fault_ = {number_, std::string(reason)};
        return false;
    }

    // Makes UTF-8 of the file, whatever it was.
    bool decode(std::string_view file) {
        bool whole = true;
        if (file.starts_with(kUtf16Mark)) {
            file.remove_prefix(kUtf16Mark.size());
            text_ = utf8FromUtf16(utf16FromBytes(file));
            whole = file.size() % 2 == 0;
        } else if (file.starts_with(kOldHeader)) {
            text_ = utf8FromUtf16(utf16FromText(textFromNarrow(file)));
        } else {
            text_ = file.substr(file.starts_with(kUtf8Mark) ? kUtf8Mark.size() : 0);
        }
        number_ = 1;
        rest_ = text_;
        for (char32_t character = 0; !rest_.empty(); number_ += character == '\n' ? 1 : 0) {
            if (!takeUtf8(rest_, character)) {
                return fail("this is no UTF-8");
            }
            if (character == 0) {
                return fail("there is a NUL character");
            }
        }
        if (!whole) {
            return fail("the file ends within a character");
        }
        rest_ = text_;
        number_ = 0;
        return true;
    }

    bool header() {
        nextLine();
        number_ = 1;
        const std::string_view first = line_.substr(0, line_.find_last_not_of(kBlanks) + 1);
        narrowHex_ = first == kOldHeader;
        return first == kHeader || narrowHex_ || fail(compose("the file does not begin with \"%s\"", {kHeader}));
    }

    bool nextLine() {
        if (rest_.empty()) {
            return false;
        }
        const std::size_t end = rest_.find('\n');
        line_ = rest_.substr(0, end);
        rest_.remove_prefix(end == std::string_view::npos ? rest_.size() : end + 1);
        if (line_.ends_with('\r')) {
            line_.remove_suffix(1);
        }
        ++number_;
        return true;
    }

    void skipBlanks() { line_.remove_prefix(std::min(line_.find_first_not_of(kBlanks), line_.size())); }

    // Nothing but a comment is left of the line.
    bool atEnd() {
        skipBlanks();
        return line_.empty() || line_.front() == ';';
    }

    bool take(std::string_view text) {
        if (!line_.starts_with(text)) {
            return false;
        }
        line_.remove_prefix(text.size());
        return true;
    }

    bool takeHex(std::size_t digits, std::uint32_t& number) {
        const auto [end, error] =
            std::from_chars(line_.data(), line_.data() + std::min(digits, line_.size()), number, 16);
        line_.remove_prefix(static_cast<std::size_t>(end - line_.data()));
        return error == std::errc{};
    }

    bool ended() { return atEnd() || fail("there is more on the line than its value"); }

    // Appends the leading surrogates that begin with a character, and the control character behind them.
    static void takeShifted(char32_t character, std::string_view& utf8, std::u16string& utf16) {
        do {
            appendUtf16(utf16, character);
        } while (takeUtf8(utf8, character) && isLeading(character));
        if (!isLeading(character)) {
            appendUtf16(utf16, character > kShifted && character < kShifted + 0x80 ? character - kShifted : character);
        }
    }

    // The text of the ports, with the control characters that travelled as surrogates.
    static std::string plain(std::string_view utf8) {
        std::u16string utf16;
        bool literal = false;
        for (char32_t character = 0; takeUtf8(utf8, character); literal = !literal && character == kEscaped) {
            if (literal && isLeading(character)) {
                takeShifted(character, utf8, utf16);
            } else if (!isEscape(character)) {
                appendUtf16(utf16, character);
            } else if (literal || character != kEscaped) {
                appendUtf16(utf16, literal ? character : character - kEscaped);
            }
        }
        return textFromUtf16(utf16);
    }

    // A text in quotation marks that the line begins with.
    bool quoted(std::string& text) {
        std::string utf8;
        for (line_.remove_prefix(1); !line_.empty(); line_.remove_prefix(1)) {
            if (line_.front() == '"') {
                line_.remove_prefix(1);
                text = plain(utf8);
                return true;
            }
            if (line_.front() == '\\') {
                line_.remove_prefix(1);
                if (line_.empty() || (line_.front() != '"' && line_.front() != '\\')) {
                    return fail("a backslash in a text is not followed by a backslash or a quotation mark");
                }
            }
            utf8 += line_.front();
        }
        return fail("a text is not closed by a quotation mark on its line");
    }

    bool key() {
        const std::string_view whole = line_.substr(0, line_.find_last_not_of(kBlanks) + 1);
        if (!whole.ends_with(']')) {
            return fail("a key is not closed by a bracket at the end of its line");
        }
        line_ = whole.substr(1, whole.size() - 2);
        KeyChange change;
        change.line = number_;
        change.remove = take("-");
        const std::string name = plain(line_);
        if (!parseKeyName(name, change.name)) {
            return fail("the key is in none of HKEY_LOCAL_MACHINE, HKEY_USERS and HKEY_CURRENT_USER");
        }
        const std::string& path = change.name.path;
        if (path.starts_with('\\') || name.ends_with('\\') || path.find("\\\\") != std::string::npos) {
            return fail("the key has a part without a name");
        }
        if (checkKeyPath(path) != kSuccess) {
            return fail("the key has a part that no key can be named");
        }
        if (change.remove && path.empty()) {
            return fail("a root cannot be deleted");
        }
        atKeyLine_ = !change.remove;
        changes_.push_back(std::move(change));
        return true;
    }

    bool keyClass() {
        line_.remove_prefix(kClassComment.size() - 1);
        return quoted(changes_.back().keyClass) && ended();
    }

    bool value() {
        ValueChange change;
        change.line = number_;
        if (line_.front() == '"') {
            if (!quoted(change.name)) {
                return false;
            }
        } else if (!take("@")) {
            return fail("the line is no key, no value and no comment");
        }
        if (changes_.empty() || changes_.back().remove) {
            return fail("the value belongs to no key");
        }
        if (checkValueName(change.name) != kSuccess) {
            return fail("no value can be named so");
        }
        skipBlanks();
        if (!take("=")) {
            return fail("there is no equals sign after the name");
        }
        skipBlanks();
        if (!data(change)) {
            return false;
        }
        changes_.back().values.push_back(std::move(change));
        return true;
    }

    bool data(ValueChange& change) {
        if (take("-")) {
            change.remove = true;
            return ended();
        }
        if (line_.starts_with('"')) {
            change.type = ValueType::sz;
            if (!quoted(change.data)) {
                return false;
            }
            change.data += '\0';
            return ended();
        }
        return take("dword:") ? dword(change) : hexList(change);
    }

    bool dword(ValueChange& change) {
        std::uint32_t number = 0;
        if (!takeHex(8, number)) {
            return fail("a dword is 1 to 8 hexadecimal digits");
        }
        change.type = ValueType::dword;
        for (unsigned shift = 0; shift < 32; shift += 8) {
            change.data += static_cast<char>(number >> shift & 0xFF);
        }
        return ended();
    }

    bool hexList(ValueChange& change) {
        std::uint32_t number = 0;
        change.type = ValueType::binary;
        if (take("hex(")) {
            if (!takeHex(8, number) || !take("):")) {
                return fail("a type in brackets is 1 to 8 hexadecimal digits and a colon follows");
            }
            change.type = static_cast<ValueType>(number);
        } else if (!take("hex:")) {
            return fail("the data is no text, no dword and no hex list");
        }
        if (!bytes(change.data)) {
            return false;
        }
        if (isTextType(change.type)) {
            hexText(change.type, change.data);
        }
        return true;
    }

    // A list of bytes, continued on the next line after a backslash.
    bool bytes(std::string& data) {
        bool more = false;  // after a comma
        for (;;) {
            skipBlanks();
            if (take("\\")) {
                if (!continuation()) {
                    return false;
                }
                continue;
            }
            if (atEnd()) {
                return !more || fail("the list ends in a comma");
            }
            std::uint32_t byte = 0;
            if ((!data.empty() && !more) || !takeHex(2, byte)) {
                return fail("a list of bytes is pairs of hexadecimal digits with commas between them");
            }
            data += static_cast<char>(byte);
            skipBlanks();
            more = take(",");
        }
    }

    bool continuation() { return ended() && (nextLine() || fail("the file ends within a value")); }

    void hexText(ValueType& type, std::string& data) const {
        if (narrowHex_) {
            data = textFromNarrow(data);
        } else if (data.size() % 2 != 0) {
            type = oddText(type);
        } else {
            data = textFromUtf16(utf16FromBytes(data));
        }
    }

    std::vector<KeyChange>& changes_;
    TextFault& fault_;
    std::string text_;
    std::string_view rest_;
    std::string_view line_;
    std::uint32_t number_ = 0;
    bool narrowHex_ = false;  // the older form has texts in hex in the narrow encoding
    bool atKeyLine_ = false;
};

}  // namespace

std::string regTextHeader() {
    return std::string(kHeader) + '\n';
}

void appendRegKey(std::string_view name, std::string_view keyClass, std::string& text) {
    text.append("\n[").append(nameText(name)).append("]\n");
    if (!keyClass.empty()) {
        text += kClassComment.substr(0, kClassComment.size() - 1);
        appendQuoted(nameText(keyClass), text);
        text += '\n';
    }
}

void appendRegValue(const KeyValue& value, std::string& text) {
    appendValueName(value.name, text);
    appendData(value, text);
    text += '\n';
}

void appendRegKeyRemoval(std::string_view name, std::string& text) {
    text.append("\n[-").append(nameText(name)).append("]\n");
}

void appendRegValueRemoval(std::string_view name, std::string& text) {
    appendValueName(name, text);
    text += "-\n";
}

void appendRegText(const KeyRecord& key, std::string& text) {
    appendRegKey(key.name, key.keyClass, text);
    for (const KeyValue& value : key.values) {
        appendRegValue(value, text);
    }
}

std::string utf16FileText(std::string_view text) {
    std::string lines;
    lines.reserve(text.size());
    for (const char c : text) {
        lines.append(c == '\n' ? "\r" : "").append(1, c);
    }
    std::u16string utf16;
    utf16FromUtf8(lines, utf16);
    return bytesFromUtf16(utf16);
}

bool parseRegText(std::string_view file, std::vector<KeyChange>& changes, TextFault& fault) {
    std::vector<KeyChange> read;
    if (!Parser(read, fault).run(file)) {
        return false;
    }
    changes = std::move(read);
    return true;
}

}  // namespace kz7
