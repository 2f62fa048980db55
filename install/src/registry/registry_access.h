// Registry operations that the flows share: single values, probes and whole trees. Paths are below HKEY_LOCAL_MACHINE
// unless a root is given.
#pragma once

#include <string>
#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7 {

// kFilenameExceedsRange for a path over 1,023 characters: cut, it would name another key.
Status checkPathLength(std::string_view path);

// Stores a text with its terminating NUL, and creates the key and its parents. `path` has no placeholder left.
Status setText(IRegistryStore& registry, std::string_view path, std::string_view name, std::string_view data);

// Reads a value as text up to its first NUL. kMoreData also for a value that fills `data` and has no NUL.
Status queryText(IRegistryStore& registry, KeyHandle key, std::string_view name, Buffer& data);

// Whether a value exists. Only kFileNotFound means that it does not; any other status may hide a value.
bool valueExists(IRegistryStore& registry, KeyHandle key, std::string_view name);

// Copies everything below one key to another, with names and classes, and creates the target. Without `overwrite`,
// values that the target already has are preserved.
class TreeCopy {
public:
    explicit TreeCopy(IRegistryStore& registry) : registry_(registry) {}

    // The first failure ends the copy and is its status: also a path over 1,023 characters, a name or value that does
    // not fit the buffers, and a link instead of a key.
    Status copy(KeyHandle sourceRoot, std::string_view sourcePath, KeyHandle targetRoot, std::string_view targetPath,
                bool overwrite);

private:
    Status copyKey(KeyHandle sourceParent, std::string_view sourcePath, KeyHandle targetParent,
                   std::string_view targetPath);
    Status copySubkeys(KeyHandle source, KeyHandle target);
    Status copyValues(KeyHandle source, KeyHandle target);

    IRegistryStore& registry_;
    bool overwrite_ = false;
    std::string path_;  // of the last level, the longer one of source and target
    // Shared by all levels: a set of buffers for each level would overflow a small stack.
    TextBuffer<260> name_;
    TextBuffer<260> class_;
    TextBuffer<260> valueName_;
    TextBuffer<10000> data_;
};

// Deletes a key and everything below it, except each subkey named `sparedSubkey` (compared with case) and the keys
// above it. Of a link, the link itself is deleted. `path` may hold the copy-name placeholder; `view` is 0 or a view
// bit. Returns the status of the last step; kBadKey for an empty path.
Status deleteTree(IRegistryStore& registry, KeyHandle root, std::string_view path, AccessMask view,
                  std::string_view copyName, std::string_view sparedSubkey);

}  // namespace kz7
