// This machine's ports on the embedded store.
#include "install/platform/platform.h"

#include <csignal>

#include "install/platform/embedded/assembly_cache.h"
#include "install/platform/embedded/console.h"
#include "install/platform/embedded/debug_output.h"
#include "install/platform/embedded/file_system.h"
#include "install/platform/embedded/library_loader.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/embedded/services.h"

namespace kz7 {
namespace {

class EmbeddedPlatform final : public IPlatform {
public:
    explicit EmbeddedPlatform(const PlatformOptions& options)
        : program_(options.program),
          directory_(options.stateDirectory.empty() ? usualStateDirectory() : options.stateDirectory),
          debugOutput_(console_),
          files_(directory_),
          registry_(directory_, options.readOnly,
                    [this](const StoreFault& fault) {
                        console_.writeError(program_ + ": " + fault.file + ": " + fault.reason + "\n");
                    }),
          services_(registry_, files_),
          libraries_(directory_),
          assemblies_(registry_, directory_) {}

    IRegistryStore& registry() override { return registry_; }
    IServiceManager& services() override { return services_; }
    IConsole& console() override { return console_; }
    IDebugOutput& debugOutput() override { return debugOutput_; }
    IFileSystem& files() override { return files_; }
    ILibraryLoader& libraries() override { return libraries_; }
    IAssemblyCache& assemblies() override { return assemblies_; }
    std::string storeName() override { return registry_.path(); }

private:
    std::string program_;
    std::string directory_;
    EmbeddedConsole console_;
    EmbeddedDebugOutput debugOutput_;
    EmbeddedFileSystem files_;
    EmbeddedRegistry registry_;
    EmbeddedServiceManager services_;
    EmbeddedLibraryLoader libraries_;
    EmbeddedAssemblyCache assemblies_;
};

}  // namespace

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options) {
    // A reader that went away or a file at its limit is a status of the write, never the end of a half-done run.
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
    return std::make_unique<EmbeddedPlatform>(options);
}

int hostExitCode(Status status) {
    const int seen = static_cast<int>(status & 0xFF);
    return status != kSuccess && seen == 0 ? 1 : seen;
}

}  // namespace kz7
