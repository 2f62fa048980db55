#include "tests/support/backends.h"

namespace kz7::test {

const std::size_t kFloodMebibytes = 100;
const bool kExitCodesAreWhole = false;

std::string childProgram() {
    return std::filesystem::read_symlink("/proc/self/exe").parent_path() / "kz7_child.exe";
}

HostPorts hostPorts(const std::string& place) {
    // This host starts no services.
    return {hostPlatform({.program = "test", .stateDirectory = place}), "C:\\contract", place + "/drive_c/contract",
            childProgram()};
}

void setSearchPath(const std::string& path) {
    setenv("PATH", path.c_str(), 1);
}

}  // namespace kz7::test
