// A folder of its own that goes when the object does.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <string>

namespace kz7::test {

class TemporaryDirectory {
public:
    TemporaryDirectory() {
        if (mkdtemp(path_.data()) == nullptr) {
            std::abort();
        }
    }
    ~TemporaryDirectory() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    TemporaryDirectory(const TemporaryDirectory&) = delete;
    TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

    const std::string& path() const { return path_; }

private:
    std::string path_ = std::filesystem::temp_directory_path() / "kz7test.XXXXXX";
};

}  // namespace kz7::test
