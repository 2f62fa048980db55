#include <filesystem>

#include "install/platform/embedded/process_host.h"
#include "install/platform/embedded/threads.h"
#include "tests/support/host_processes.h"

namespace kz7::test {

const std::size_t kFloodMebibytes = 100;

std::unique_ptr<IProcessHost> hostProcesses() {
    return std::make_unique<EmbeddedProcessHost>("/nonexistent");
}

std::unique_ptr<IThreads> hostThreads() {
    return std::make_unique<EmbeddedThreads>();
}

std::string childProgram() {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path() / "kz7_child.exe";
}

}  // namespace kz7::test
