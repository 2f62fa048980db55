// This machine's ports, built on first use: a run that only prints its usage creates nothing.
#pragma once

#include <memory>
#include <string>

#include "install/platform/assembly_cache.h"
#include "install/platform/clock.h"
#include "install/platform/console.h"
#include "install/platform/debug_output.h"
#include "install/platform/file_system.h"
#include "install/platform/host_identity.h"
#include "install/platform/library_loader.h"
#include "install/platform/line_channel.h"
#include "install/platform/process_host.h"
#include "install/platform/registry_store.h"
#include "install/platform/service_manager.h"
#include "install/platform/terminal.h"
#include "install/platform/threads.h"

namespace kz7 {

struct PlatformOptions {
    std::string program;              // begins the lines that the platform itself writes on standard error
    std::string stateDirectory = {};  // where an embedded store lives; empty: this user's usual place
    bool readOnly = false;            // reads what is there, takes no writer's lock, creates nothing
    bool plainStreams = false;        // standard input and output carry bytes, their line ends stay as they are
    bool ownProcess = true;           // false: a library in somebody else's, which leaves the process as it is
};

// The references stay valid as long as the platform. One thread.
class IPlatform {
public:
    virtual ~IPlatform() = default;

    virtual IRegistryStore& registry() = 0;
    virtual IServiceManager& services() = 0;
    virtual IConsole& console() = 0;
    virtual IDebugOutput& debugOutput() = 0;
    virtual IFileSystem& files() = 0;
    virtual IProcessHost& processes() = 0;
    virtual IThreads& threads() = 0;
    virtual ILibraryLoader& libraries() = 0;
    virtual IAssemblyCache& assemblies() = 0;
    virtual ILineChannel& lines() = 0;
    virtual IClock& clock() = 0;
    virtual ITerminal& terminal() = 0;
    virtual IHostIdentity& identity() = 0;

    // The folder of what the programs keep for themselves, one of the product's paths; made where it is missing.
    virtual Status ownFolder(std::string& path) = 0;

    // The store's name for people: the file it is kept in, or the machine's registry.
    virtual std::string storeName() = 0;

    // What a person who looks at that store should know about its choice: a sentence without an end, mostly
    // none.
    virtual std::string storeNote() = 0;

    // Whether the store is the programs' own and holds nothing else; else it is the whole machine's.
    virtual bool storeIsOwn() = 0;

    // Whether a fault of the store was told on standard error, so that its status needs no further line.
    virtual bool storeFaultTold() = 0;
};

std::unique_ptr<IPlatform> hostPlatform(const PlatformOptions& options);

// The number a process exits with for a status. Where the host keeps only 8 bits of it, a failure whose
// low 8 bits are 0 exits with 1, so that it is never read as success.
int hostExitCode(Status status);

}  // namespace kz7
