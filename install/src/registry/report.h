// The tool's console lines: progress and success on standard output, errors on standard error with a prefix that holds
// the line number that support knows the error by.
#pragma once

#include <cstdint>
#include <initializer_list>
#include <string_view>

#include "install/platform/console.h"
#include "install/platform/text.h"

namespace kz7 {

// An error line: its number and its pattern.
struct ErrorText {
    std::uint32_t line;
    std::string_view pattern;
};

class Report {
public:
    explicit Report(IConsole& console) : console_(console) {}

    void line(std::string_view pattern, std::initializer_list<Insert> inserts = {}) {
        console_.writeOutput(compose(pattern, inserts));
    }

    void error(const ErrorText& text, std::initializer_list<Insert> inserts = {}) {
        console_.writeError(compose("install\\src\\%s:%u: ", {std::string_view("uselvlkz7reg.cpp"), text.line}) +
                            compose(text.pattern, inserts));
    }

    // An error line without the prefix.
    void bareError(std::string_view pattern, std::initializer_list<Insert> inserts = {}) {
        console_.writeError(compose(pattern, inserts));
    }

private:
    IConsole& console_;
};

}  // namespace kz7
