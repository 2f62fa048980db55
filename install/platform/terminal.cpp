#include "install/platform/terminal.h"

#include <cstdio>

namespace kz7 {

Status readLineOf(const std::function<int()>& next, Buffer& line) {
    std::uint32_t length = 0;  // of what fits
    bool any = false;
    bool carriageReturn = false;  // read and not yet known to be part of the line
    const auto keep = [&](char c) {
        if (length < line.capacity) {
            line.data[length++] = c;
        }
    };
    int c = next();
    for (; c != EOF && c != '\n'; c = next()) {
        if (carriageReturn) {
            keep('\r');
        }
        carriageReturn = c == '\r';
        if (!carriageReturn) {
            keep(static_cast<char>(c));
        }
        any = true;
    }
    if (c == EOF && !any) {
        return kEndOfFile;
    }
    line.size = static_cast<std::uint32_t>(cutText({line.data, length}, line.limit).size());
    return kSuccess;
}

}  // namespace kz7
