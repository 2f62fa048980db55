#include "tests/support/backends.h"

#include "install/platform/memory/platform.h"

namespace kz7::test {
namespace {

class MemoryBackend final : public Backend {
public:
    MemoryBackend() { platform_.files_.add(program()); }

    IPlatform& platform() override { return platform_; }
    std::string folder() override { return "C:\\contract"; }
    std::string program() override { return folder() + "\\Program.exe"; }
    std::string written(bool both, const std::function<void(IConsole&)>& writing) override {
        writing(platform_.console_);
        return both ? platform_.console_.both : platform_.console_.output;
    }

private:
    MemoryPlatform platform_;
};

}  // namespace

std::unique_ptr<Backend> backendNamed(std::string_view name) {
    return name == "host" ? hostBackend() : std::make_unique<MemoryBackend>();
}

}  // namespace kz7::test
