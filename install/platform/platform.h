// This machine's ports. Each opens what it needs on first use: a run that only prints its usage creates nothing.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "install/platform/assembly_cache.h"
#include "install/platform/console.h"
#include "install/platform/debug_output.h"
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
    bool plainStreams = false;        // standard input and output carry bytes, their line ends stay as they are
    bool ownProcess = true;           // false: a library in somebody else's, which leaves the process as it is
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

    // The folder of what the programs keep for themselves, as a product path; created if it is missing.
    virtual Status ownFolder(std::string& path) = 0;

    // The store's name for people: its file, or the machine's registry.
    virtual std::string storeName() = 0;

    // What a person who looks at that store should know about its choice: a sentence without a full stop, usually
    // empty.
    virtual std::string storeNote() { return {}; }

    // Whether the store is the programs' own and holds nothing else. Otherwise it is that of the whole machine.
    virtual bool storeIsOwn() { return true; }

    // Whether a fault of the store was reported on standard error, so that its status needs no further line.
    virtual bool storeFaultTold() { return false; }

    // The assembly cache of this machine as it would act on another registry, without a change to the machine.
    virtual std::unique_ptr<IAssemblyCache> assembliesOn(IRegistryStore& registry) = 0;

    // The content of a file that holds the whole store as it is at one moment, also while others write.
    // kFileNotFound: no store exists. kCallNotImplemented: the store is not the programs' own.
    virtual Status storeImage(std::string&) { return kCallNotImplemented; }

    // Whether the store does not exist, or was found to be damaged.
    virtual bool storeIsLost() { return false; }

    // Puts a new store with what `fill` writes in the place of this one, or creates the missing one. The old one keeps
    // its content under the name `kept`, empty if there was none. kBusy: another program has it open. A fault is
    // reported.
    virtual Status replaceStore(const std::function<Status(IRegistryStore&)>&, std::string& /*kept*/) {
        return kCallNotImplemented;
    }

    // Lists the damages of a store that is the programs' own; other stores are the host's to examine.
    virtual Status examineStore(std::vector<std::string>&) { return kSuccess; }

    // Whether a path, as users of this host write it, names a file of the store, or of another one that has a log.
    virtual bool isStoreFile(const std::string&) { return false; }

protected:
    Ports ports_;
};

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options);

// The number a process exits with for a status. Where the host keeps only 8 bits of it, a failure whose
// low 8 bits are 0 exits with 1, so that it is never read as success.
int hostExitCode(Status status);

}  // namespace kz7
