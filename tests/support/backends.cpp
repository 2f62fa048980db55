#include "tests/support/backends.h"

#include <unistd.h>

#include <cstdio>
#include <cstring>
#include <fstream>
#include <utility>
#include <vector>

#include "install/platform/memory/platform.h"
#include "tests/support/temporary_directory.h"

namespace kz7::test {
namespace {

namespace fs = std::filesystem;

class MemoryBackend final : public Backend {
public:
    MemoryBackend() {
        platform_.files_.add(program());
        platform_.libraries_.libraries[library()]["sqleGetLevelInfo"] =
            reinterpret_cast<LibraryFunction>(+[](std::uint32_t, char* level) {
                std::strcpy(level, "KZ7 v9.1.0.0");
                return 0;
            });
    }

    IPlatform& platform() override { return platform_; }
    std::string folder() override { return "C:\\contract"; }
    void addProvider() override { platform_.files_.add(folder() + "\\bin\\kz7nmpdata.dll"); }
    void reading(const std::string& input, const std::function<void()>& body) override {
        platform_.terminal_.input = input;
        body();
    }
    std::string written(const std::function<void(IConsole&)>& writing) override {
        writing(platform_.console_);
        return platform_.console_.both;
    }

private:
    MemoryPlatform platform_;
};

// Redirects streams of this process to a file that contains a text, as long as the object exists.
class Redirected {
public:
    explicit Redirected(const std::vector<int>& streams, const std::string& text = {}) {
        std::fwrite(text.data(), 1, text.size(), file_);
        std::rewind(file_);
        std::fflush(stdout);
        for (const int stream : streams) {
            kept_.emplace_back(stream, dup(stream));
            dup2(fileno(file_), stream);
        }
        std::clearerr(stdin);
    }
    ~Redirected() {
        std::fflush(stdout);
        for (const auto& [stream, kept] : kept_) {
            dup2(kept, stream);
            close(kept);
        }
        std::clearerr(stdin);
        std::fclose(file_);
    }
    Redirected(const Redirected&) = delete;
    Redirected& operator=(const Redirected&) = delete;

    // The written text with plain line feeds.
    std::string text() const {
        std::fflush(stdout);
        std::rewind(file_);
        std::string text;
        for (int c = std::fgetc(file_); c != EOF; c = std::fgetc(file_)) {
            text.append(c == '\r' ? 0 : 1, static_cast<char>(c));
        }
        return text;
    }

private:
    std::FILE* file_ = std::tmpfile();
    std::vector<std::pair<int, int>> kept_;
};

class HostBackend final : public Backend {
public:
    HostBackend() {
        fs::create_directories(ports_.hostFolder);
        fs::copy_file(ports_.service, ports_.hostFolder / "Program.exe");
        // Built next to the programs.
        const fs::path programs = fs::path(childProgram()).parent_path();
        fs::copy_file(programs.parent_path() / "examples/copy/bin/kz7install64.dll",
                      ports_.hostFolder / "kz7install64.dll");
    }

    IPlatform& platform() override { return *ports_.platform; }
    Differences differences() const override { return ports_.differences; }
    std::string folder() override { return ports_.folder; }
    void addProvider() override {
        fs::create_directory(ports_.hostFolder / "bin");
        std::ofstream(ports_.hostFolder / "bin/kz7nmpdata.dll") << "provider";
    }
    void reading(const std::string& input, const std::function<void()>& body) override {
        const Redirected fed({0}, input);
        body();
    }
    std::string written(const std::function<void(IConsole&)>& writing) override {
        const Redirected streams({1, 2});
        writing(platform().console());
        return streams.text();
    }

private:
    TemporaryDirectory place_;
    HostPorts ports_ = hostPorts(place_.path());
};

}  // namespace

std::unique_ptr<Backend> backendNamed(const std::string& name) {
    if (name == "host") {
        return std::make_unique<HostBackend>();
    }
    return std::make_unique<MemoryBackend>();
}

}  // namespace kz7::test
