#include "tests/support/backends.h"

#include <cstring>

#include "install/platform/memory/platform.h"

namespace kz7::test {
namespace {

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
    std::string program() override { return folder() + "\\Program.exe"; }
    void addProvider() override { platform_.assemblies_.files.emplace_back("kz7nmpdata.dll"); }
    void reading(const std::string& input, const std::function<void()>& body) override {
        platform_.lines_.input = input;
        body();
    }
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
