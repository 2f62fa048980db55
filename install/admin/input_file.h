// A file that a person names on the command line; "-" is standard input. What is wrong with it is told.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/admin/admin.h"

namespace kz7 {

class InputFile {
public:
    InputFile(Admin& admin, const std::string& path);

    // The whole of it into bytes().
    Answer read();
    const std::string& bytes() const { return bytes_; }

    // A line of it, counted from 1, that is none.
    Answer badLine(std::uint32_t line, std::string_view reason);

    // Its name for people.
    const std::string& shown() const { return shown_; }

private:
    Admin& admin_;
    std::string path_;
    std::string shown_;
    std::string bytes_;
};

}  // namespace kz7
