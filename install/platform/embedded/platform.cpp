// This machine's ports on the embedded store.
#include "install/platform/platform.h"

#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <filesystem>

#include "install/platform/assembly_records.h"
#include "install/platform/embedded/history.h"
#include "install/platform/embedded/ports.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/service_records.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

// Child programs run in other directories.
std::string absolute(const std::string& directory) {
    std::error_code error;
    const std::string whole = directory.empty() ? directory : std::filesystem::absolute(directory, error).string();
    return error ? directory : whole;
}

class EmbeddedPlatform final : public IPlatform {
public:
    explicit EmbeddedPlatform(const PlatformOptions& options)
        : IPlatform(options),
          byDefault_(options.stateDirectory.empty() && std::getenv("KZ7_STATE_DIR") == nullptr),
          directory_(absolute(options.stateDirectory.empty() ? usualStateDirectory() : options.stateDirectory)),
          registry_(directory_, options.readOnly, listener(), {options.backup, options.missingIsEmpty}) {
        ports_ = {&registry_,   &services_,       console_.get(),  debugOutput_.get(),
                  files_.get(), processes_.get(), threads_.get(),  libraries_.get(),
                  &assemblies_, host_.get(),      terminal_.get(), &history_};
    }

    const std::string& directory() const { return directory_; }

    Status ownFolder(std::string& path) override {
        return makeFolder(directory_) != 0 ? kPathNotFound : files_->productPath(directory_, path);
    }
    std::string storeName() override { return registry_.path(); }

    std::unique_ptr<IAssemblyCache> assembliesOn(IRegistryStore& registry) override {
        return std::make_unique<AssemblyRecords>(registry, *files_);
    }
    Status storeImage(std::string& image) override { return registry_.image(image); }
    bool storeIsLost() override { return isDamaged_ || !registry_.exists(); }
    Status replaceStore(const std::function<Status(IRegistryStore&)>& fill, std::string& kept) override {
        faultTold_ = false;
        EmbeddedRegistry content({}, false, listener(), {.inMemory = true});
        Status status = fill(content);
        status = status == kSuccess ? content.commit() : status;
        return status == kSuccess ? registry_.replaceBy(content, kept) : status;
    }
    Status examineStore(std::vector<std::string>& damages) override { return registry_.examine(damages); }
    bool isStoreFile(const std::string& path) override { return registry_.isFile(path); }

    std::string storeNote() override {
        const std::string machine(kMachineStateDirectory);
        const bool hidden = access((machine + "/registry.db").c_str(), R_OK) != 0 && errno == EACCES;
        return byDefault_ && hidden ? machine + " exists too and cannot be read by you" : std::string{};
    }

private:
    EmbeddedRegistry::FaultListener listener() {
        return [this](const StoreFault& fault) {
            tellFault(shownText(fault.file) + ": " + shownText(fault.reason), fault.status);
            isDamaged_ = isDamaged_ || fault.status == kRegistryCorrupt || fault.status == kNotRegistryFile;
        };
    }

    bool byDefault_;
    bool isDamaged_ = false;
    std::string directory_;
    std::unique_ptr<IConsole> console_ = standardConsole();
    std::unique_ptr<IDebugOutput> debugOutput_ = hostDebugOutput(*console_, nullptr);
    std::unique_ptr<IFileSystem> files_ = embeddedFiles(directory_);
    EmbeddedRegistry registry_;
    EmbeddedHistory history_{registry_};
    ServiceRecords services_{registry_, *files_};
    std::unique_ptr<IProcessHost> processes_ = embeddedProcesses(directory_);
    std::unique_ptr<IThreads> threads_ = embeddedThreads();
    std::unique_ptr<ILibraryLoader> libraries_ = embeddedLibraries(directory_);
    AssemblyRecords assemblies_{registry_, *files_};
    std::unique_ptr<IHostInformation> host_ = embeddedHost();
    std::unique_ptr<ITerminal> terminal_ = embeddedTerminal();
};

}  // namespace

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options) {
    if (options.ownProcess) {
        settleInheritedState();
        // A pipe without a reader or a file at its size limit makes a write fail; it must not kill the process in the
        // middle of a run.
        std::signal(SIGPIPE, SIG_IGN);
        std::signal(SIGXFSZ, SIG_IGN);
    }
    auto platform = std::make_unique<EmbeddedPlatform>(options);
    if (options.ownProcess && !platform->directory().empty()) {
        // Child programs use the same store from any directory.
        setenv("KZ7_STATE_DIR", platform->directory().c_str(), 1);
    }
    return platform;
}

int hostExitCode(Status status) {
    const int seen = static_cast<int>(status & 0xFF);
    return status != kSuccess && seen == 0 ? 1 : seen;
}

}  // namespace kz7
