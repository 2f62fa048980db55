// A new folder that only its owner can use, deleted with the object.
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
    // Files that a program still has open remain.
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
