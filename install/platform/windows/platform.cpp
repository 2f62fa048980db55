// This machine's ports on Windows.
#include "install/platform/platform.h"

#include <fcntl.h>
#include <io.h>
#include <windows.h>

#include <cstdio>

#include "install/platform/windows/change_lock.h"
#include "install/platform/windows/ports.h"
#include "install/platform/windows/wide_text.h"

namespace kz7 {
namespace {

class WindowsPlatform final : public IPlatform {
public:
    explicit WindowsPlatform(const PlatformOptions& options)
        : IPlatform(options),
          // The library in an installer changes keys of one user only.
          lock_(options.ownProcess && !options.readOnly, [this] { tellBusy(); }) {
        ports_ = {registry_.get(),   services_.get(),  console_.get(),  debugOutput_.get(),
                  files_.get(),      processes_.get(), threads_.get(),  libraries_.get(),
                  assemblies_.get(), host_.get(),      terminal_.get(), history_.get()};
    }

    // In the user's profile, where no other user can place a file or a link first.
    Status ownFolder(std::string& path) override {
        const std::string folder = environmentText("LOCALAPPDATA");
        const std::string own = folder + "\\KZ7";
        if (folder.empty() ||
            (CreateDirectoryW(WideText(own).c_str(), nullptr) == FALSE && GetLastError() != ERROR_ALREADY_EXISTS)) {
            return kPathNotFound;
        }
        return files_->productPath(own, path);
    }
    std::string storeName() override { return "the registry of this machine"; }
    bool storeIsOwn() override { return false; }
    std::unique_ptr<IAssemblyCache> assembliesOn(IRegistryStore&) override { return windowsAssemblies(*files_, true); }

private:
    void tellBusy() { tellFault("%ProgramData%\\KZ7\\lock: stayed locked by another program for 5 seconds", kBusy); }

    std::unique_ptr<IConsole> console_ = windowsConsole();
    std::unique_ptr<IDebugOutput> debugOutput_ =
        hostDebugOutput(*console_, [](std::string_view text) { OutputDebugStringW(WideText(text).c_str()); });
    std::unique_ptr<IFileSystem> files_ = windowsFiles();
    ChangeLock lock_;
    std::unique_ptr<IRegistryStore> registry_ = windowsRegistry(lock_);
    std::unique_ptr<IServiceManager> services_ = windowsServices(lock_);
    std::unique_ptr<IProcessHost> processes_ = windowsProcesses();
    std::unique_ptr<IThreads> threads_ = windowsThreads();
    std::unique_ptr<ILibraryLoader> libraries_ = windowsLibraries();
    std::unique_ptr<IAssemblyCache> assemblies_ = windowsAssemblies(*files_, false);
    std::unique_ptr<IHostInformation> host_ = windowsHost();
    std::unique_ptr<ITerminal> terminal_ = windowsTerminal();
    std::unique_ptr<IHistory> history_ = windowsHistory(*debugOutput_);
};

}  // namespace

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options) {
    if (options.ownProcess) {
        // The loader does not search the current folder for any library.
        SetDllDirectoryW(L"");
    }
    if (options.plainStreams) {
        _setmode(_fileno(stdin), _O_BINARY);
        _setmode(_fileno(stdout), _O_BINARY);
    }
    return std::make_unique<WindowsPlatform>(options);
}

int hostExitCode(Status status) {
    return static_cast<int>(status);
}

}  // namespace kz7
