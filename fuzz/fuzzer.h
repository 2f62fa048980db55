// What a fuzzer is made of: `tryInput`, which checks one input and ends the process where a check does not hold.
#pragma once

#include <cstdint>
#include <cstdlib>
#include <string>
#include <string_view>

void tryInput(std::string_view input);

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    tryInput({reinterpret_cast<const char*>(data), size});
    return 0;
}

inline void check(bool holds) {
    if (!holds) {
        std::abort();
    }
}
