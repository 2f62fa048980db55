#include <windows.h>

#include "tests/support/backends.h"
#include "tests/support/captured_streams.h"
#include "tests/support/host_processes.h"

namespace kz7::test {
namespace {

class WindowsBackend final : public Backend {
public:
    IPlatform& platform() override { return *platform_; }
    Differences differences() const override {
        const HMODULE system = GetModuleHandleA("ntdll.dll");
        const bool wine = system != nullptr && GetProcAddress(system, "wine_get_version") != nullptr;
        return {.ordersValuesByName = wine,
                .ordersKeysByLowerCase = wine,
                .foldsBeyondAscii = true,
                .passesClassesOn = wine,
                .startsDeletedServices = wine};
    }
    std::string folder() override { return childProgram().substr(0, childProgram().rfind('\\')); }
    std::string program() override { return folder() + "\\kz7_test_service.exe"; }
    std::string written(bool both, const std::function<void(IConsole&)>& writing) override {
        CapturedStreams streams(both);
        writing(platform_->console());
        return streams.end();
    }

private:
    std::unique_ptr<IPlatform> platform_ = hostPlatform({.program = "test"});
};

}  // namespace

std::unique_ptr<Backend> hostBackend() {
    return std::make_unique<WindowsBackend>();
}

}  // namespace kz7::test
