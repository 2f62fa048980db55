// A folder of a benchmark, deleted with the object.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <string>

namespace kz7 {

class Scratch {
public:
    Scratch() : path_((std::filesystem::temp_directory_path() / "kz7bench.XXXXXX").string()) {
        if (mkdtemp(path_.data()) == nullptr) {
            std::abort();
        }
    }
    ~Scratch() { std::filesystem::remove_all(path_); }
    Scratch(const Scratch&) = delete;
    Scratch& operator=(const Scratch&) = delete;

    const std::string& path() const { return path_; }
    std::string file(const std::string& name) const { return path_ + '/' + name; }

private:
    std::string path_;
};

}  // namespace kz7
