// The check of an argument that names a file or a directory.
#pragma once

#include <CLI/CLI.hpp>
#include <string>

namespace kz7 {

inline CLI::Validator givenName() {
    return {[](const std::string& text) { return text.empty() ? "the name is empty" : ""; }, {}};
}

}  // namespace kz7
