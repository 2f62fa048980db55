// The registry layer that the flows share: single values, probes, and whole trees. Everything lies below
// HKEY_LOCAL_MACHINE unless a root is named; a path may hold the copy-name placeholder.
#pragma once

#include <string>
#include <string_view>

#include "install/platform/registry_store.h"

namespace kz7 {

// kFilenameExceedsRange for a path that does not fit its 1,024 bytes: cut, it would name another key.
Status checkPathLength(std::string_view path);

// Stores a text with its terminator, creating the key and its parents. `path` is substituted already.
Status setText(IRegistryStore& registry, std::string_view path, std::string_view name, std::string_view data);

// Reads a value as the text up to its first NUL. kMoreData also when it fills `data` without any.
Status queryText(IRegistryStore& registry, KeyHandle key, std::string_view name, Buffer& data);

// Whether a value is there. Only kFileNotFound means absent: any other answer is somebody's value.
bool valueExists(IRegistryStore& registry, KeyHandle key, std::string_view name);

// Copies everything below one key to another, key by key with names and classes, creating the target. With
// `overwrite` off, values that the target already has are kept.
class TreeCopy {
public:
    explicit TreeCopy(IRegistryStore& registry) : registry_(registry) {}

    // The first failure ends the copy and is its status: also a path over 1,023 bytes and a name or value that does not
    // fit the buffers.
    Status copy(KeyHandle sourceRoot, std::string_view sourcePath, KeyHandle targetRoot, std::string_view targetPath,
                bool overwrite);

private:
    Status copyBelow(bool overwrite);
    Status copySubkeys(KeyHandle source, KeyHandle target, bool overwrite);
    Status copyValues(KeyHandle source, KeyHandle target, bool overwrite);

    IRegistryStore& registry_;
    KeyHandle sourceRoot_ = KeyHandle::none;
    KeyHandle targetRoot_ = KeyHandle::none;
    std::string sourcePath_;
    std::string targetPath_;
    // One set for the whole walk: a set for each level would overflow a small stack.
    FixedBuffer<260> name_;
    FixedBuffer<260> class_;
    FixedBuffer<260> valueName_;
    FixedBuffer<10000> data_;
};

// Deletes a key with everything below it, sparing every subkey named `sparedSubkey` (exact case) with the
// keys above it. `view` is 0 or a view bit. Returns the status of the last step; kBadKey for an empty path.
Status deleteTree(IRegistryStore& registry, KeyHandle root, std::string_view path, AccessMask view,
                  std::string_view copyName, std::string_view sparedSubkey);

}  // namespace kz7
