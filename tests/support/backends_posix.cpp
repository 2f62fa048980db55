#include <filesystem>
#include <fstream>

#include "tests/support/backends.h"
#include "tests/support/captured_streams.h"
#include "tests/support/temporary_directory.h"

namespace kz7::test {
namespace {

class EmbeddedBackend final : public Backend {
public:
    EmbeddedBackend() : platform_(hostPlatform({.program = "test", .stateDirectory = directory_.path()})) {
        std::filesystem::create_directories(hostFolder_);
        std::ofstream(hostFolder_ + "/Program.exe") << "program";
        std::filesystem::copy_file(sampleLibrary(), hostFolder_ + "/kz7install64.dll");
    }

    IPlatform& platform() override { return *platform_; }
    std::string folder() override { return "C:\\contract"; }
    std::string program() override { return folder() + "\\Program.exe"; }
    void addProvider() override {
        std::filesystem::create_directory(hostFolder_ + "/bin");
        std::ofstream(hostFolder_ + "/bin/kz7nmpdata.dll") << "provider";
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
    TemporaryDirectory directory_;
    std::string hostFolder_ = directory_.path() + "/drive_c/contract";
    std::unique_ptr<IPlatform> platform_;
};

}  // namespace

const std::size_t kFloodMebibytes = 100;

std::string childProgram() {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path() / "kz7_child.exe";
}

std::unique_ptr<Backend> hostBackend() {
    return std::make_unique<EmbeddedBackend>();
}

}  // namespace kz7::test
