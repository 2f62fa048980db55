#include "install/runtime/response_file.h"

#include <algorithm>

#include "install/platform/encoding.h"
#include "install/runtime/guarded.h"

namespace kz7 {
namespace {

constexpr std::string_view kBlanks = " \t";
constexpr std::string_view kUtf8Mark = "\xEF\xBB\xBF";

std::string_view trimmed(std::string_view text) {
    const std::size_t begin = std::min(text.find_first_not_of(kBlanks), text.size());
    return text.substr(begin, text.find_last_not_of(kBlanks) + 1 - begin);
}

bool isNameCharacter(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_' || c == '.';
}

// Null for a good value, else what is wrong with it.
const char* parseValue(std::string_view text, std::string& value) {
    if (!text.starts_with('"')) {
        value = text;
        return nullptr;
    }
    for (std::size_t at = 1; at < text.size(); ++at) {
        if (text[at] == '"') {
            if (at + 1 == text.size()) {
                return nullptr;
            }
            if (text[++at] != '"') {
                return "there is text after the closing quotation mark";
            }
        }
        value += text[at];
    }
    return "the closing quotation mark is missing";
}

// Null for a good line.
const char* parseLine(std::string_view line, ResponseKeyword& keyword) {
    if (line.find('\0') != std::string_view::npos) {
        return "there is a NUL in it";
    }
    const std::size_t equals = line.find('=');
    if (equals == std::string_view::npos) {
        return "there is no '=' in it";
    }
    keyword.name = trimmed(line.substr(0, equals));
    if (keyword.name.empty()) {
        return "there is no name before the '='";
    }
    if (!std::all_of(keyword.name.begin(), keyword.name.end(), isNameCharacter)) {
        return "a name has letters, digits, '_' and '.' only";
    }
    return parseValue(trimmed(line.substr(equals + 1)), keyword.value);
}

Status parseLines(std::string_view file, std::vector<ResponseKeyword>& keywords, ResponseFault& fault) {
    std::vector<ResponseKeyword> found;
    file.remove_prefix(file.starts_with(kUtf8Mark) ? kUtf8Mark.size() : 0);
    const std::string text = textFromNarrow(file);
    file = text;
    for (std::uint32_t number = 1; !file.empty(); ++number) {
        const std::size_t end = std::min(file.find('\n'), file.size());
        std::string_view line = file.substr(0, end);
        file.remove_prefix(std::min(end + 1, file.size()));
        line.remove_suffix(line.ends_with('\r') ? 1 : 0);
        line = trimmed(line);
        if (line.empty() || line.front() == '*' || line.front() == ';') {
            continue;
        }
        ResponseKeyword keyword;
        keyword.line = number;
        if (const char* reason = parseLine(line, keyword); reason != nullptr) {
            fault = {number, reason};
            return kInvalidData;
        }
        found.push_back(std::move(keyword));
    }
    keywords = std::move(found);
    return kSuccess;
}

}  // namespace

Status parseResponseFile(std::string_view file, std::vector<ResponseKeyword>& keywords, ResponseFault& fault) {
    const Status status = guarded([&] { return parseLines(file, keywords, fault); });
    if (status == kNoMemory) {
        fault = {0, kNoMemoryReason};
    }
    return status;
}

Status ureReadRspFile(IFileSystem& files, std::string_view path, std::vector<ResponseKeyword>& keywords,
                      ResponseFault& fault) {
    std::string file;
    const Status status = guarded([&] { return files.readFile(path, file); });
    if (status != kSuccess) {
        fault = {0, kUnreadableReason};
        return status;
    }
    return parseResponseFile(file, keywords, fault);
}

}  // namespace kz7
