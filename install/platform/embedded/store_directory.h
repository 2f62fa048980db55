// The state directory: which one it is, how it is made, and how the processes that make the store in it keep out
// of each other's way.
#pragma once

#include <string>

#include "install/platform/embedded/descriptor.h"

namespace kz7 {

inline constexpr const char* kMachineStateDirectory = "/var/lib/kz7";
inline constexpr const char* kStoreName = "registry.db";
inline constexpr int kSmallestStore = 512;  // bytes of the smallest SQLite database that is not empty

// $KZ7_STATE_DIR; else /var/lib/kz7 for root; else $XDG_STATE_HOME/kz7 or ~/.local/state/kz7; else empty.
std::string usualStateDirectory();

// Makes a directory and its missing parents for their owner alone. Each new one is synced with its parent, so that a
// power cut does not take a store with its directory. 0 or an error number.
int makeFolder(const std::string& path);

// Opens a directory and locks it exclusively for as long as `folder` is open; the system unlocks it when a process
// dies. EWOULDBLOCK: another process held the lock all the time.
int lockFolder(const std::string& path, int milliseconds, OwnedDescriptor& folder);

// Names for files that are being built: a prefix and random digits. False: errno is the reason.
bool randomName(const std::string& prefix, std::string& name);
bool unfinishedStoreName(std::string& name);

// Gives a new file the owner and the mode of the store that it replaces; without one, the owner of the directory: a run
// of root must not lock the user out who owns the store. False: errno is the reason.
bool inheritOwner(const std::string& directory, const OwnedDescriptor& file);

// Gives a store and its log another name, `registry.db.old` or the next free one; a log without a store too, which
// would be applied to the next store. `kept` is empty if there is neither. The caller holds the lock of the directory.
// A file smaller than kSmallestStore is in its place until another store gets it; a call after a process that was
// killed meanwhile goes on. 0 or an error number, and then nothing has changed.
int setAside(const std::string& directory, std::string& kept);

// Gives them their first names again; `kept` is empty then.
void takeBack(const std::string& directory, std::string& kept);

// Removes what builders of a store have left in a directory. The caller holds its lock, so all of them are dead.
void removeUnfinishedStores(const std::string& path);

}  // namespace kz7
