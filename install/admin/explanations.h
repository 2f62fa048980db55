// What support and administrators need to know of an error line or a status: one row each.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/status.h"

namespace kz7 {

struct LineExplanation {
    std::uint32_t line;
    std::string_view options;  // that print it
    std::string_view step;
    std::string_view cause;
    std::string_view left;  // what is on disk then
    std::string_view next;
};

struct StatusExplanation {
    Status status;
    std::string_view name;
    bool isExitCode;  // of kz7InstallReg
    std::string_view cause;
    std::string_view next;
};

std::span<const LineExplanation> lineExplanations();
std::span<const StatusExplanation> statusExplanations();

// What a word may mean: an error line's number, a status in decimal or hexadecimal, also negative, and for a number up
// to 255 the statuses that a POSIX shell shows as that.
struct Meanings {
    std::vector<const LineExplanation*> lines;
    std::vector<const StatusExplanation*> statuses;
    std::vector<const StatusExplanation*> seenInShell;

    bool empty() const { return lines.empty() && statuses.empty() && seenInShell.empty(); }
};
bool findMeanings(std::string_view word, Meanings& meanings);

// The error lines and statuses that pasted output mentions, each once, in order.
Meanings findMentioned(std::string_view text);

}  // namespace kz7
