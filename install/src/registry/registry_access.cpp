#include "install/src/registry/registry_access.h"

#include <utility>
#include <vector>

#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

constexpr std::size_t kMaxDepth = 1 << 16;  // levels below the first key; more are a cycle in a damaged store

// Deletes a tree depth first. Each level is opened below the handle of the level above: a path could lead elsewhere by
// now, through a link that another program puts into it. Iterative: the depth of a tree is input.
class TreeDeletion {
public:
    TreeDeletion(IRegistryStore& registry, KeyHandle root, AccessMask view, std::string_view spared)
        : registry_(registry), root_(root), view_(view), spared_(spared) {}

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
        std::string path;         // below the level above
        std::uint32_t index = 0;  // of the subkeys to spare
    };

    // The root, or the last level.
    KeyHandle parent() const { return levels_.empty() ? root_ : levels_.back().key.get(); }

    Status open(std::string_view path) {
        Level level{OwnedKey(registry_), std::string(path)};
        Status status = levels_.size() > kMaxDepth ? kRegistryCorrupt : checkPathLength(level.path);
        if (succeeded(status)) {
            status = registry_.openKey(parent(), level.path, kKeyFull | kKeyOpenLink | view_, level.key.receive());
        }
        if (succeeded(status)) {
            levels_.push_back(std::move(level));
        }
        return status;
    }

    // Deletes the key of the last level, which has no subkeys left but spared ones.
    Status deleteLast() {
        const std::string path = std::move(levels_.back().path);
        levels_.pop_back();
        return registry_.deleteKey(parent(), path, view_);
    }

    IRegistryStore& registry_;
    KeyHandle root_;
    AccessMask view_;
    std::string_view spared_;
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
    overwrite_ = overwrite;
    path_ = sourcePath.size() > targetPath.size() ? sourcePath : targetPath;
    return copyKey(sourceRoot, sourcePath, targetRoot, targetPath);
}

Status TreeCopy::copyKey(KeyHandle sourceParent, std::string_view sourcePath, KeyHandle targetParent,
                         std::string_view targetPath) {
    OwnedKey source(registry_);
    OwnedKey target(registry_);
    Status status = checkPathLength(path_);
    if (succeeded(status)) {
        status = registry_.openKey(sourceParent, sourcePath, kKeyRead | kKeyRefuseLink, source.receive());
    }
    if (succeeded(status)) {
        status = registry_.createKey(targetParent, targetPath, {}, kKeyCopyTarget | kKeyRefuseLink, target.receive());
    }
    if (succeeded(status)) {
        status = copySubkeys(source.get(), target.get());
    }
    return succeeded(status) ? copyValues(source.get(), target.get()) : status;
}

// Each level is opened below the handles of the level above: a path could lead elsewhere by now.
Status TreeCopy::copySubkeys(KeyHandle source, KeyHandle target) {
    const std::size_t length = path_.size();
    for (std::uint32_t index = 0;; ++index) {
        Status status = registry_.enumerateKey(source, index, name_, &class_);
        if (!succeeded(status)) {
            return isEndOfItems(status) ? kSuccess : status;
        }
        OwnedKey made(registry_);
        status = registry_.createKey(target, name_.view(), class_.view(), kKeyFull | kKeyRefuseLink, made.receive());
        if (!succeeded(status)) {
            return status;
        }
        made.reset();
        path_.append(1, '\\').append(name_.view());
        const std::string name(name_.view());
        status = copyKey(source, name, target, name);
        if (!succeeded(status)) {
            return status;
        }
        path_.resize(length);
    }
}

Status TreeCopy::copyValues(KeyHandle source, KeyHandle target) {
    for (std::uint32_t index = 0;; ++index) {
        ValueType type{};
        Status status = registry_.enumerateValue(source, index, valueName_, &type, &data_);
        if (!succeeded(status)) {
            return isEndOfItems(status) ? kSuccess : status;
        }
        if (!overwrite_ && valueExists(registry_, target, valueName_.view())) {
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
    // In the path alone: a subkey whose name holds a placeholder is deleted like any other.
    return TreeDeletion(registry, root, view, sparedSubkey).run(substituteCopyName(path, copyName));
}

}  // namespace kz7
