#include <windows.h>

#include <filesystem>
#include <fstream>

#include "tests/support/backends.h"
#include "tests/support/captured_streams.h"

namespace kz7::test {
namespace {

class WindowsBackend final : public Backend {
public:
    WindowsBackend() {
        const std::string programs = childProgram().substr(0, childProgram().rfind('\\') + 1);
        std::filesystem::remove_all(folder());
        std::filesystem::create_directories(folder());
        std::filesystem::copy_file(programs + "kz7_test_service.exe", program());
        std::filesystem::copy_file(sampleLibrary(), library());
    }
    ~WindowsBackend() override {
        // A program that is just ending keeps its file; the next backend finds a folder of another name.
        std::error_code ignored;
        std::filesystem::remove_all(folder(), ignored);
    }

    IPlatform& platform() override { return *platform_; }
    Differences differences() const override {
        const HMODULE system = GetModuleHandleA("ntdll.dll");
        const bool wine = system != nullptr && GetProcAddress(system, "wine_get_version") != nullptr;
        return {.ordersValuesByName = wine,
                .ordersKeysByLowerCase = wine,
                .foldsBeyondAscii = true,
                .passesClassesOn = wine,
                .startsDeletedServices = wine,
                .needsFramework = true,
                .usesHandlesAgain = true};
    }
    std::string folder() override { return folder_; }
    std::string program() override { return folder() + "\\Program.exe"; }
    void addProvider() override {
        std::filesystem::create_directory(folder() + "/bin");
        std::ofstream(folder() + "/bin/kz7nmpdata.dll") << "provider";
    }
    void reading(const std::string& input, const std::function<void()>& body) override {
        const FedInput fed(input);
        body();
    }
    std::string written(bool both, const std::function<void(IConsole&)>& writing) override {
        CapturedStreams streams(both);
        writing(platform_->console());
        return streams.end();
    }

private:
    static std::string freshFolder() {
        static int count = 0;
        return std::filesystem::temp_directory_path().string() + "kz7contract" + std::to_string(GetCurrentProcessId()) +
               "_" + std::to_string(++count);
    }

    std::string folder_ = freshFolder();
    std::unique_ptr<IPlatform> platform_ = hostPlatform({.program = "test"});
};

}  // namespace

const std::size_t kFloodMebibytes = 10;

std::string childProgram() {
    char path[MAX_PATH] = {};
    GetModuleFileNameA(nullptr, path, MAX_PATH);
    const std::string own(path);
    return own.substr(0, own.rfind('\\') + 1) + "kz7_child.exe";
}

std::unique_ptr<Backend> hostBackend() {
    return std::make_unique<WindowsBackend>();
}

}  // namespace kz7::test
