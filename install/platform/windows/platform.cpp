// This machine's ports on Windows.
#include "install/platform/platform.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <cstdio>

#include "install/platform/windows/assembly_cache.h"
#include "install/platform/windows/console.h"
#include "install/platform/windows/debug_output.h"
#include "install/platform/windows/file_system.h"
#include "install/platform/windows/host_information.h"
#include "install/platform/windows/library_loader.h"
#include "install/platform/windows/process_host.h"
#include "install/platform/windows/registry.h"
#include "install/platform/windows/services.h"
#include "install/platform/windows/terminal.h"
#include "install/platform/windows/threads.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

class WindowsPlatform final : public IPlatform {
public:
    WindowsPlatform() {
        ports_ = {&registry_, &services_,  &console_,    &debugOutput_, &files_,   &processes_,
                  &threads_,  &libraries_, &assemblies_, &host_,        &terminal_};
    }

    // The caller's own, so that nobody else can have put something in its place.
    Status ownFolder(std::string& path) override {
        const std::string folder =
            textOf([](wchar_t* room, DWORD size) { return GetEnvironmentVariableW(L"LOCALAPPDATA", room, size); });
        const std::string own = folder + "\\KZ7";
        if (folder.empty() ||
            (CreateDirectoryW(WideText(own).c_str(), nullptr) == FALSE && GetLastError() != ERROR_ALREADY_EXISTS)) {
            return kPathNotFound;
        }
        return files_.productPath(own, path);
    }
    std::string storeName() override { return "the registry of this machine"; }
    bool storeIsOwn() override { return false; }

private:
    WindowsConsole console_;
    WindowsDebugOutput debugOutput_{console_};
    WindowsFileSystem files_;
    WindowsRegistry registry_;
    WindowsServiceManager services_;
    WindowsProcessHost processes_;
    WindowsThreads threads_;
    WindowsLibraryLoader libraries_;
    WindowsAssemblyCache assemblies_;
    WindowsHost host_;
    WindowsTerminal terminal_;
};

}  // namespace

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options) {
    if (options.ownProcess) {
        // Libraries that the system loads for itself are not taken from the current folder either.
        SetDllDirectoryW(L"");
    }
    if (options.plainStreams) {
        _setmode(_fileno(stdin), _O_BINARY);
        _setmode(_fileno(stdout), _O_BINARY);
    }
    return std::make_unique<WindowsPlatform>();
}

int hostExitCode(Status status) {
    return static_cast<int>(status);
}

}  // namespace kz7
