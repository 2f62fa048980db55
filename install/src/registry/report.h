// The tool's console lines: progress and success on standard output, errors on standard error with a prefix that holds
// the line number that support knows the error by.
#pragma once

#include <algorithm>
#include <cstdint>
#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/console.h"
#include "install/platform/status.h"
#include "install/platform/text.h"

namespace kz7 {

// When an error line reports no failure: with this status only, never, or always.
inline constexpr Status kNever = kSuccess;
inline constexpr Status kAlways = kFailed;

// An error line: its number and its pattern.
struct ErrorText {
    std::uint32_t line;
    std::string_view pattern;
    Status harmless = kNever;
};

// An error line that was written.
struct ErrorLine {
    std::uint32_t line = 0;  // 0: without a number
    Status status = kSuccess;
    std::string text;
    bool isFailure = true;
};

inline bool hasFailure(const std::vector<ErrorLine>& errors) {
    return std::any_of(errors.begin(), errors.end(), [](const ErrorLine& error) { return error.isFailure; });
}

class Report {
public:
    // With `errors`, also keeps the error lines there.
    explicit Report(IConsole& console, std::vector<ErrorLine>* errors = nullptr) : console_(console), errors_(errors) {}

    // The same lines on another console.
    Report(const Report& other, IConsole& console) : Report(console, other.errors_) {}

    IConsole& console() { return console_; }

    void line(std::string_view pattern, std::initializer_list<Insert> inserts = {}) {
        if (!console_.isSilent()) {
            console_.writeOutput(compose(pattern, inserts));
        }
    }

    void error(const ErrorText& text, std::initializer_list<Insert> inserts = {}) {
        const std::string line = compose(text.pattern, inserts);
        console_.writeError(compose("install\\src\\%s:%u: ", {std::string_view("uselvlkz7reg.cpp"), text.line}) + line);
        if (errors_ != nullptr) {
            Status status = kSuccess;
            for (const Insert& insert : inserts) {
                const auto* const number = std::get_if<std::uint32_t>(&insert);
                status = number == nullptr ? status : *number;
            }
            const bool isHarmless = text.harmless == kAlways || (text.harmless != kNever && text.harmless == status);
            errors_->push_back({text.line, status, line, !isHarmless});
        }
    }

    // An error line without the prefix.
    void bareError(std::string_view pattern, std::initializer_list<Insert> inserts = {}) {
        const std::string line = compose(pattern, inserts);
        console_.writeError(line);
        if (errors_ != nullptr) {
            errors_->push_back({0, kSuccess, line, true});
        }
    }

private:
    IConsole& console_;
    std::vector<ErrorLine>* errors_;
};

}  // namespace kz7
