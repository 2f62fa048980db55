// A folder of its own, its owner's alone, that goes when the object does.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <random>
#include <string>

namespace kz7::test {

class TemporaryDirectory {
public:
    TemporaryDirectory() {
        if (!std::filesystem::create_directory(path_)) {
            std::abort();
        }
        std::filesystem::permissions(path_, std::filesystem::perms::owner_all);
    }
    // What a program that is just ending keeps open stays.
    ~TemporaryDirectory() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    TemporaryDirectory(const TemporaryDirectory&) = delete;
    TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

    const std::string& path() const { return path_; }

private:
    std::string path_ =
        (std::filesystem::temp_directory_path() / ("kz7test." + std::to_string(std::random_device()()))).string();
};

}  // namespace kz7::test
