// The placeholders in registry paths and other texts: "$CurrentInstallationName$" stands for the name of the current
// copy, "$DefaultInstallationName$" for that of the default copy.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace kz7 {

inline constexpr std::size_t kSubstitutedSize = 1024;  // characters of a substituted text with its terminator

// Whether a name is one component of registry paths and of host paths, without control characters below U+0020.
bool isOneName(std::string_view name);

// Replaces every "$CurrentInstallationName$" of `text` by the name, or every "$DefaultInstallationName$" if the text
// has none of the first. Inserted names are not searched again; an empty name leaves the text unchanged. The result is
// not cut: callers with kSubstitutedSize bytes check its length.
std::string substituteCopyName(std::string_view text, std::string_view copyName);

// The same for callers with their own buffers, cut to kSubstitutedSize. `copyName` may be null. With an `outputSize`
// the result goes to `output`, cut to that size and terminated; with 0 it goes to a process-wide buffer that the next
// such call overwrites. Returns `text` itself if nothing was replaced, else the buffer written; null if `text` with its
// terminator is longer than `outputSize`, which is checked before the substitution only.
const char* iSubstituteCopyName(const char* text, const char* copyName, std::uint32_t outputSize, char* output);

// Puts a text, cut to kSubstitutedSize, into the process-wide buffer of iSubstituteCopyName().
void overwriteSharedOutput(std::string_view text);

}  // namespace kz7
