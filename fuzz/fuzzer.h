// The entry point of a fuzzer. The one source that includes this header defines `tryInput`, which checks one input and
// aborts the process if a check fails.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

void tryInput(std::string_view input);

// NOLINTNEXTLINE(misc-definitions-in-headers)
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    tryInput({reinterpret_cast<const char*>(data), size});
    return 0;
}

inline void check(bool holds) {
    if (!holds) {
        std::abort();
    }
}
