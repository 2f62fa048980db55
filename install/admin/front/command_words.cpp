#include "install/admin/front/command_words.h"

#include <algorithm>
#include <string_view>

#include "install/platform/text.h"

namespace kz7 {
namespace {

// Neither a splitter nor a command interpreter acts upon any character of such a word.
bool isPlain(std::string_view word) {
    constexpr std::string_view kPlain = "-_./\\:+@";
    return !word.empty() && std::all_of(word.begin(), word.end(), [&](char c) {
        const char letter = static_cast<char>(c | 0x20);
        return (c >= '0' && c <= '9') || (letter >= 'a' && letter <= 'z') || kPlain.find(c) != std::string_view::npos;
    });
}

}  // namespace

std::string joinArguments(const std::vector<std::string>& words) {
    std::string line;
    for (const std::string& word : words) {
        // The word of the program ends at its closing quotation mark, even after a backslash.
        if (line.empty()) {
            line += '"' + word + '"';
            continue;
        }
        // Command interpreters know their options without quotation marks only.
        if (isPlain(word)) {
            line += ' ' + word;
            continue;
        }
        line += " \"";
        std::size_t backslashes = 0;
        for (const char c : word) {
            if (c == '"') {
                line.append(backslashes + 1, '\\');
            }
            backslashes = c == '\\' ? backslashes + 1 : 0;
            line += c;
        }
        line.append(backslashes, '\\');
        line += '"';
    }
    return line;
}

bool canPassWords(const std::vector<std::string>& words) {
    // The system passes over blanks and dots at the end of a file's name.
    const std::string_view program(words.front());
    const std::string_view file = program.substr(0, program.find_last_not_of(". ") + 1);
    const std::string_view ending = file.substr(file.size() - std::min<std::size_t>(file.size(), 4));
    const auto isActedUpon = [](char c) { return c == '"' || c == '%' || (c >= 0 && c < ' ') || c == 0x7F; };
    return (!equalsIgnoreCase(ending, ".bat") && !equalsIgnoreCase(ending, ".cmd")) ||
           std::none_of(words.begin(), words.end(),
                        [&](const std::string& word) { return std::any_of(word.begin(), word.end(), isActedUpon); });
}

}  // namespace kz7
