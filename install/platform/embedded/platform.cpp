// This machine's ports on the embedded store.
#include "install/platform/platform.h"

#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <filesystem>

#include "install/platform/embedded/assembly_cache.h"
#include "install/platform/embedded/clock.h"
#include "install/platform/embedded/debug_output.h"
#include "install/platform/embedded/file_system.h"
#include "install/platform/embedded/host_identity.h"
#include "install/platform/embedded/library_loader.h"
#include "install/platform/embedded/line_channel.h"
#include "install/platform/embedded/process_host.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/embedded/services.h"
#include "install/platform/embedded/terminal.h"
#include "install/platform/embedded/threads.h"
#include "install/platform/shown_text.h"
#include "install/platform/standard_console.h"

namespace kz7 {
namespace {

// Programs are started in folders of their own.
std::string absolute(const std::string& directory) {
    std::error_code error;
    const std::string whole = directory.empty() ? directory : std::filesystem::absolute(directory, error).string();
    return error ? directory : whole;
}

class EmbeddedPlatform final : public IPlatform {
public:
    explicit EmbeddedPlatform(const PlatformOptions& options)
        : program_(options.program),
          byDefault_(options.stateDirectory.empty() && std::getenv("KZ7_STATE_DIR") == nullptr),
          directory_(absolute(options.stateDirectory.empty() ? usualStateDirectory() : options.stateDirectory)),
          debugOutput_(console_),
          files_(directory_),
          registry_(directory_, options.readOnly,
                    [this](const StoreFault& fault) {
                        if (!faultTold_) {
                            console_.writeError(program_ + ": " + shownText(fault.file) + ": " + shownText(fault.reason) +
                                                "\n");
                        }
                        faultTold_ = true;
                    }),
          services_(registry_, files_),
          processes_(directory_),
          libraries_(directory_),
          assemblies_(registry_, directory_) {}

    const std::string& directory() const { return directory_; }

    IRegistryStore& registry() override { return registry_; }
    IServiceManager& services() override { return services_; }
    IConsole& console() override { return console_; }
    IDebugOutput& debugOutput() override { return debugOutput_; }
    IFileSystem& files() override { return files_; }
    IProcessHost& processes() override { return processes_; }
    IThreads& threads() override { return threads_; }
    ILibraryLoader& libraries() override { return libraries_; }
    IAssemblyCache& assemblies() override { return assemblies_; }
    ILineChannel& lines() override { return lines_; }
    IClock& clock() override { return clock_; }
    ITerminal& terminal() override { return terminal_; }
    IHostIdentity& identity() override { return identity_; }
    Status ownFolder(std::string& path) override {
        return makeFolder(directory_) != 0 ? kPathNotFound : files_.productPath(directory_, path);
    }
    std::string storeName() override { return registry_.path(); }
    bool storeIsOwn() override { return true; }
    bool storeFaultTold() override { return faultTold_; }

    std::string storeNote() override {
        const std::string machine(kMachineStateDirectory);
        const bool hidden = access((machine + "/registry.db").c_str(), R_OK) != 0 && errno == EACCES;
        return byDefault_ && hidden ? machine + " exists too and cannot be read by you" : std::string{};
    }

private:
    std::string program_;
    bool byDefault_;
    bool faultTold_ = false;
    std::string directory_;
    StandardConsole console_;
    EmbeddedDebugOutput debugOutput_;
    EmbeddedFileSystem files_;
    EmbeddedRegistry registry_;
    EmbeddedServiceManager services_;
    EmbeddedProcessHost processes_;
    EmbeddedThreads threads_;
    EmbeddedLibraryLoader libraries_;
    EmbeddedAssemblyCache assemblies_;
    EmbeddedLineChannel lines_;
    EmbeddedClock clock_;
    EmbeddedTerminal terminal_;
    EmbeddedHostIdentity identity_;
};

}  // namespace

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options) {
    if (options.ownProcess) {
        settleInheritedState();
        // A reader that went away or a file at its limit is a status of the write, never the end of a half-done run.
        std::signal(SIGPIPE, SIG_IGN);
        std::signal(SIGXFSZ, SIG_IGN);
    }
    auto platform = std::make_unique<EmbeddedPlatform>(options);
    if (options.ownProcess && !options.stateDirectory.empty()) {
        // Programs that are started work on the same store.
        setenv("KZ7_STATE_DIR", platform->directory().c_str(), 1);
    }
    return platform;
}

int hostExitCode(Status status) {
    const int seen = static_cast<int>(status & 0xFF);
    return status != kSuccess && seen == 0 ? 1 : seen;
}

}  // namespace kz7
