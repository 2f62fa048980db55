#include "install/src/registry/registry_access.h"

#include <utility>
#include <vector>

#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

constexpr std::size_t kMaxDepth = 1 << 16;  // levels below the first key; more are a cycle in a damaged store

// Deletes a tree depth first. It holds a handle for each level, so that a subkey whose path does not fit can be reached
// from the key above it. Iterative: the depth of a tree is input.
class TreeDeletion {
public:
    TreeDeletion(IRegistryStore& registry, KeyHandle root, AccessMask view, std::string_view copyName,
                 std::string_view spared)
        : registry_(registry), root_(root), view_(view), copyName_(copyName), spared_(spared) {}

    Status run(std::string_view path) {
        Status status = open(path);
        while (succeeded(status) && !levels_.empty()) {
            Level& level = levels_.back();
            status = registry_.enumerateKey(level.key.get(), level.index, name_, nullptr);
            if (isEndOfItems(status)) {
                status = deleteLast();
            } else if (succeeded(status) && !spared_.empty() && spared_ == name_.view()) {
                ++level.index;
            } else if (succeeded(status)) {
                status = open(name_.view());
            }
        }
        return status;
    }

private:
    struct Level {
        OwnedKey key;
        KeyHandle parent;         // where `address` begins: the root, or the level above
        std::string address;      // the substituted path, or the subkey's name if that path does not fit
        std::size_t pathLength;   // of path_ without this level
        std::uint32_t index = 0;  // of the subkeys to spare
    };

    // Opens the first key by its path, or a subkey of the last level.
    Status open(std::string_view name) {
        Level level{OwnedKey(registry_), root_, {}, path_.size()};
        // Below a level whose path does not fit, none does.
        if (levels_.empty() || levels_.back().parent == root_) {
            path_.append(levels_.empty() ? "" : "\\").append(name);
            level.address = substituteCopyName(path_, copyName_);
        }
        const Status fits = level.address.empty() ? kFilenameExceedsRange : checkPathLength(level.address);
        if (!succeeded(fits)) {
            if (levels_.empty()) {
                return fits;
            }
            level.parent = levels_.back().key.get();
            level.address = name;
        }
        if (levels_.size() > kMaxDepth) {
            return kRegistryCorrupt;
        }
        const Status status = registry_.openKey(level.parent, level.address, kKeyFull | view_, level.key.receive());
        if (succeeded(status)) {
            levels_.push_back(std::move(level));
        }
        return status;
    }

    // Deletes the key of the last level, which has no subkeys left but spared ones.
    Status deleteLast() {
        Level& level = levels_.back();
        level.key.reset();
        const Status status = registry_.deleteKey(level.parent, level.address, view_);
        path_.resize(level.pathLength);
        levels_.pop_back();
        return status;
    }

    IRegistryStore& registry_;
    KeyHandle root_;
    AccessMask view_;
    std::string_view copyName_;
    std::string_view spared_;
    std::string path_;  // unsubstituted, of the last level whose path fits
    std::vector<Level> levels_;
    TextBuffer<256> name_;
};

}  // namespace

// Deliberate: a path that does not fit fails the operation; cut, it would name another key.
Status checkPathLength(std::string_view path) {
    return fitsCharacters(path, kSubstitutedSize - 1) ? kSuccess : kFilenameExceedsRange;
}

Status setText(IRegistryStore& registry, std::string_view path, std::string_view name, std::string_view data) {
    OwnedKey key(registry);
    Status status = checkPathLength(path);
    if (succeeded(status)) {
        status = registry.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key.receive());
    }
    return succeeded(status) ? registry.setValue(key.get(), name, ValueType::sz, std::string(data) + '\0') : status;
}

Status queryText(IRegistryStore& registry, KeyHandle key, std::string_view name, Buffer& data) {
    ValueType type{};
    const Status status = registry.queryValue(key, name, &type, data);
    if (!succeeded(status) || data.text().size() != data.size) {
        return status;
    }
    const bool isFull = isTextType(type) ? !fitsCharacters(data.view(), data.limit - 1) : data.size == data.limit;
    return isFull ? kMoreData : kSuccess;
}

bool valueExists(IRegistryStore& registry, KeyHandle key, std::string_view name) {
    FixedBuffer<1> probe;
    return !isNotFound(registry.queryValue(key, name, nullptr, probe));
}

Status TreeCopy::copy(KeyHandle sourceRoot, std::string_view sourcePath, KeyHandle targetRoot,
                      std::string_view targetPath, bool overwrite) {
    sourceRoot_ = sourceRoot;
    targetRoot_ = targetRoot;
    sourcePath_ = sourcePath;
    targetPath_ = targetPath;
    return copyBelow(overwrite);
}

Status TreeCopy::copyBelow(bool overwrite) {
    OwnedKey source(registry_);
    OwnedKey target(registry_);
    Status status = checkPathLength(sourcePath_.size() > targetPath_.size() ? sourcePath_ : targetPath_);
    if (succeeded(status)) {
        status = registry_.openKey(sourceRoot_, sourcePath_, kKeyRead, source.receive());
    }
    if (succeeded(status)) {
        status = registry_.createKey(targetRoot_, targetPath_, {}, kKeyCopyTarget, target.receive());
    }
    if (succeeded(status)) {
        status = copySubkeys(source.get(), target.get(), overwrite);
    }
    return succeeded(status) ? copyValues(source.get(), target.get(), overwrite) : status;
}

Status TreeCopy::copySubkeys(KeyHandle source, KeyHandle target, bool overwrite) {
    const std::size_t sourceLength = sourcePath_.size();
    const std::size_t targetLength = targetPath_.size();
    for (std::uint32_t index = 0;; ++index) {
        Status status = registry_.enumerateKey(source, index, name_, &class_);
        if (!succeeded(status)) {
            return isEndOfItems(status) ? kSuccess : status;
        }
        OwnedKey made(registry_);
        status = registry_.createKey(target, name_.view(), class_.view(), kKeyFull, made.receive());
        if (!succeeded(status)) {
            return status;
        }
        made.reset();
        sourcePath_.append(1, '\\').append(name_.view());
        targetPath_.append(1, '\\').append(name_.view());
        status = copyBelow(overwrite);
        if (!succeeded(status)) {
            return status;
        }
        sourcePath_.resize(sourceLength);
        targetPath_.resize(targetLength);
    }
}

Status TreeCopy::copyValues(KeyHandle source, KeyHandle target, bool overwrite) {
    for (std::uint32_t index = 0;; ++index) {
        ValueType type{};
        Status status = registry_.enumerateValue(source, index, valueName_, &type, &data_);
        if (!succeeded(status)) {
            return isEndOfItems(status) ? kSuccess : status;
        }
        if (!overwrite && valueExists(registry_, target, valueName_.view())) {
            continue;
        }
        status = registry_.setValue(target, valueName_.view(), type, data_.view());
        if (!succeeded(status)) {
            return status;
        }
    }
}

Status deleteTree(IRegistryStore& registry, KeyHandle root, std::string_view path, AccessMask view,
                  std::string_view copyName, std::string_view sparedSubkey) {
    if (path.empty()) {
        return kBadKey;
    }
    return TreeDeletion(registry, root, view, copyName, sparedSubkey).run(path);
}

}  // namespace kz7
