// This machine's ports. Each opens what it needs on first use: a run that only prints its usage creates nothing.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "install/platform/assembly_cache.h"
#include "install/platform/console.h"
#include "install/platform/file_system.h"
#include "install/platform/history.h"
#include "install/platform/host_information.h"
#include "install/platform/library_loader.h"
#include "install/platform/process_host.h"
#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/platform/terminal.h"
#include "install/platform/threads.h"

namespace kz7 {

struct PlatformOptions {
    std::string program;              // begins the lines that the platform itself writes on standard error
    std::string stateDirectory = {};  // where an embedded store lives; empty: this user's usual place
    std::string backup = {};          // a copy of an embedded store that is read instead of a store
    bool readOnly = false;            // reads what is there, takes no writer's lock, creates nothing
    bool missingIsEmpty = false;      // with readOnly: a state directory that does not exist reads as empty
    bool plainStreams = false;        // standard input and output are bytes; line ends are not converted
    bool ownProcess = true;           // false: in a library, which must not change the state of the process

    // Gets the line about a fault of the store, without the program's name, and its status; empty: the line goes to
    // standard error.
    std::function<void(const std::string&, Status)> tellFault = {};
};

// The ports of one machine, none of them owned.
struct Ports {
    IRegistryStore* registry = nullptr;
    IServiceManager* services = nullptr;
    IConsole* console = nullptr;
    IDebugOutput* debugOutput = nullptr;
    IFileSystem* files = nullptr;
    IProcessHost* processes = nullptr;
    IThreads* threads = nullptr;
    ILibraryLoader* libraries = nullptr;
    IAssemblyCache* assemblies = nullptr;
    IHostInformation* host = nullptr;
    ITerminal* terminal = nullptr;
    IHistory* history = nullptr;  // null: nothing is recorded
};

// The references stay valid as long as the platform. One thread.
class IPlatform {
public:
    virtual ~IPlatform() = default;

    const Ports& ports() const { return ports_; }
    IRegistryStore& registry() { return *ports_.registry; }
    IServiceManager& services() { return *ports_.services; }
    IConsole& console() { return *ports_.console; }
    IDebugOutput& debugOutput() { return *ports_.debugOutput; }
    IFileSystem& files() { return *ports_.files; }
    IProcessHost& processes() { return *ports_.processes; }
    IThreads& threads() { return *ports_.threads; }
    ILibraryLoader& libraries() { return *ports_.libraries; }
    IAssemblyCache& assemblies() { return *ports_.assemblies; }
    IHostInformation& host() { return *ports_.host; }
    ITerminal& terminal() { return *ports_.terminal; }

    // Null: the machine has none.
    IHistory* history() { return ports_.history; }

    // The folder for the programs' own files, such as logs, as a product path; created if it is missing.
    virtual Status ownFolder(std::string& path) = 0;

    // The store's name for people: its file, or the machine's registry.
    virtual std::string storeName() = 0;

    // A remark for people on why this store was chosen, without a full stop; usually empty.
    virtual std::string storeNote() { return {}; }

    // Whether the store has only data of these programs. False: it is the registry of the machine.
    virtual bool storeIsOwn() { return true; }

    // Whether a fault of the store was reported, so that callers do not report it again.
    bool storeFaultTold() const { return faultTold_; }

    // The assembly cache of this machine as it would act on another registry, without a change to the machine.
    virtual std::unique_ptr<IAssemblyCache> assembliesOn(IRegistryStore& registry) = 0;

    // A consistent copy of the whole store as the content of a file; other programs may write meanwhile.
    // kFileNotFound: no store exists. kRegistryCorrupt: it is damaged. kCallNotImplemented: the store is the registry
    // of the machine.
    virtual Status storeImage(std::string&) { return kCallNotImplemented; }

    // Whether the store does not exist, or was found to be damaged.
    virtual bool storeIsLost() { return false; }

    // Replaces the store by a new one that `fill` writes, or creates a missing one. The old file is renamed to `kept`,
    // which is empty without one; also after a failure that comes later. kBusy: another program has the store open.
    // Faults are reported on standard error.
    virtual Status replaceStore(const std::function<Status(IRegistryStore&)>&, std::string& /*kept*/) {
        return kCallNotImplemented;
    }

    // Lists the damages of a store that is the programs' own; other stores are the host's to examine.
    virtual Status examineStore(std::vector<std::string>&) { return kSuccess; }

    // Whether a path, as users of this host write it, names a file of the store, or of another one that has a log.
    virtual bool isStoreFile(const std::string&) { return false; }

protected:
    explicit IPlatform(const PlatformOptions& options = {})
        : program_(options.program), tellFault_(options.tellFault) {}

    // Reports the first fault of the store; the others follow from it.
    void tellFault(const std::string& line, Status status) {
        if (!faultTold_ && tellFault_) {
            tellFault_(line, status);
        } else if (!faultTold_) {
            console().writeError(program_ + ": " + line + "\n");
        }
        faultTold_ = true;
    }

    Ports ports_;
    bool faultTold_ = false;

private:
    std::string program_;
    std::function<void(const std::string&, Status)> tellFault_;
};

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options);

// The exit code for a status. On hosts that keep only 8 bits of it, a failure whose low 8 bits are 0 exits with 1.
int hostExitCode(Status status);

}  // namespace kz7
