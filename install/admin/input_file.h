// A file named on the command line; "-" is standard input. Errors are reported here.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/admin/admin.h"

namespace kz7 {

class InputFile {
public:
    InputFile(Admin& admin, const std::string& path);

    // Reads the whole file into bytes().
    Answer read();
    const std::string& bytes() const { return bytes_; }

    // Reports an error in a line, counted from 1.
    Answer badLine(std::uint32_t line, std::string_view reason);

    // The name as messages show it.
    const std::string& shown() const { return shown_; }

private:
    Admin& admin_;
    std::string path_;
    std::string shown_;
    std::string bytes_;
};

}  // namespace kz7
