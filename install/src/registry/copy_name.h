// The placeholders of registry paths and other texts: "$CurrentInstallationName$" stands for the name of
// the copy at hand, "$DefaultInstallationName$" for that of the default copy.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace kz7 {

inline constexpr std::size_t kSubstitutedSize = 1024;  // bytes of a substituted text with its terminator

// Replaces every "$CurrentInstallationName$" of `text` by the name; only where there is none, every
// "$DefaultInstallationName$". What is inserted is not searched again; an empty name leaves the text as it
// is. The result is whole: whoever has only kSubstitutedSize bytes for it judges its length.
std::string substituteCopyName(std::string_view text, std::string_view copyName);

// The same for callers with buffers of their own, cut to kSubstitutedSize. `copyName` may be null. With an `outputSize`
// the result goes to `output`, cut to that size and terminated; with 0 it goes to one process-wide buffer that the next
// such call overwrites. Returns `text` itself when nothing was replaced, else the buffer written; null when
// `text` with its terminator is longer than `outputSize`, which is checked before substituting only.
const char* iSubstituteCopyName(const char* text, const char* copyName, std::uint32_t outputSize, char* output);

// Puts a text, cut to kSubstitutedSize, into the process-wide buffer of iSubstituteCopyName().
void overwriteSharedOutput(std::string_view text);

}  // namespace kz7
