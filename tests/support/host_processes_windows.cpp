#include <windows.h>

#include "install/platform/windows/process_host.h"
#include "install/platform/windows/threads.h"
#include "tests/support/host_processes.h"

namespace kz7::test {

const std::size_t kFloodMebibytes = 10;

std::unique_ptr<IProcessHost> hostProcesses() {
    return std::make_unique<WindowsProcessHost>();
}

std::unique_ptr<IThreads> hostThreads() {
    return std::make_unique<WindowsThreads>();
}

std::string childProgram() {
    char path[MAX_PATH] = {};
    GetModuleFileNameA(nullptr, path, MAX_PATH);
    const std::string own(path);
    return own.substr(0, own.rfind('\\') + 1) + "kz7_child.exe";
}

}  // namespace kz7::test
