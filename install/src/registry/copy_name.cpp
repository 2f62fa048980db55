#include "install/src/registry/copy_name.h"

#include <algorithm>

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kCurrentName = "$CurrentInstallationName$";
constexpr std::string_view kDefaultName = "$DefaultInstallationName$";

// Deliberate: one buffer for the process; callers without an output of their own share it, and a later call overwrites
// an earlier result.
FixedText<kSubstitutedSize> sharedOutput;

// Whether a byte continues a UTF-8 character.
bool isWithinCharacter(char c) {
    return (static_cast<unsigned char>(c) & 0xC0) == 0x80;
}

// Copies a text into a caller's buffer, cut to its size and terminated.
void copyOut(std::string_view text, std::uint32_t size, char* output) {
    std::size_t taken = std::min<std::size_t>(text.size(), size - 1);
    while (taken < text.size() && taken != 0 && isWithinCharacter(text[taken])) {
        --taken;
    }
    output[text.copy(output, taken)] = '\0';
}

}  // namespace

bool isOneName(std::string_view name) {
    return name != "." && name != ".." &&
           std::none_of(name.begin(), name.end(), [](char c) { return c == '\\' || c == '/' || (c >= 0 && c < ' '); });
}

std::string substituteCopyName(std::string_view text, std::string_view copyName) {
    const std::string_view token = text.find(kCurrentName) != std::string_view::npos ? kCurrentName : kDefaultName;
    std::string result;
    std::size_t at = copyName.empty() ? std::string_view::npos : text.find(token);
    while (at != std::string_view::npos) {
        result.append(text.substr(0, at)).append(copyName);
        text.remove_prefix(at + token.size());
        at = text.find(token);
    }
    return result.append(text);
}

const char* iSubstituteCopyName(const char* text, const char* copyName, std::uint32_t outputSize, char* output) {
    if (text == nullptr || (outputSize != 0 && output == nullptr)) {
        return nullptr;
    }
    const std::string_view given = text;
    // Deliberate: the size is checked before the substitution, so that a text that is too long only because of its
    // placeholder is refused; callers size their buffers by the template.
    if (outputSize != 0 && given.size() + 1 > outputSize) {
        return nullptr;
    }
    const std::string substituted = substituteCopyName(given, copyName == nullptr ? std::string_view{} : copyName);
    const bool same = substituted == given;
    const FixedText<kSubstitutedSize> result(substituted);
    if (outputSize != 0) {
        copyOut(same ? given : result.view(), outputSize, output);
        return same ? text : output;
    }
    if (same) {
        return text;
    }
    overwriteSharedOutput(result.view());
    return sharedOutput.c_str();
}

void overwriteSharedOutput(std::string_view text) {
    sharedOutput.assign(text);
}

}  // namespace kz7
