#include "install/src/registry/registry_access.h"

#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

class TreeDeletion {
public:
    TreeDeletion(IRegistryStore& registry, KeyHandle root, AccessMask view, std::string_view copyName,
                 std::string_view spared)
        : registry_(registry), root_(root), view_(view), copyName_(copyName), spared_(spared) {}

    // `path` is extended by every level below it and substituted again there, as it stands.
    Status run(std::string& path) {
        const std::string substituted = substituteCopyName(path, copyName_);
        Status status = checkPathLength(substituted);
        if (status != kSuccess) {
            return status;
        }
        OwnedKey key(registry_);
        status = registry_.openKey(root_, substituted, kKeyFull | view_, key.receive());
        if (status != kSuccess) {
            return status;
        }
        status = deleteSubkeys(key.get(), path);
        key.reset();
        return isEndOfItems(status) ? registry_.deleteKey(root_, substituted, view_) : status;
    }

private:
    // kNoMoreItems when none is left but the spared ones.
    Status deleteSubkeys(KeyHandle key, std::string& path) {
        const std::size_t length = path.size();
        std::uint32_t index = 0;
        for (;;) {
            Status status = registry_.enumerateKey(key, index, name_, nullptr);
            if (status != kSuccess) {
                return status;
            }
            if (!spared_.empty() && spared_ == name_.view()) {
                ++index;
                continue;
            }
            path.append(1, '\\').append(name_.view());
            status = run(path);
            path.resize(length);
            if (status != kSuccess) {
                return status;
            }
        }
    }

    IRegistryStore& registry_;
    KeyHandle root_;
    AccessMask view_;
    std::string_view copyName_;
    std::string_view spared_;
    FixedBuffer<256> name_;
};

}  // namespace

// Deliberate: a path that does not fit fails the operation; cut, it would name another key.
Status checkPathLength(std::string_view path) {
    return path.size() < kSubstitutedSize ? kSuccess : kFilenameExceedsRange;
}

Status setText(IRegistryStore& registry, std::string_view path, std::string_view name, std::string_view data) {
    OwnedKey key(registry);
    Status status = checkPathLength(path);
    if (status == kSuccess) {
        status = registry.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key.receive());
    }
    return status != kSuccess ? status : registry.setValue(key.get(), name, ValueType::sz, std::string(data) + '\0');
}

Status queryText(IRegistryStore& registry, KeyHandle key, std::string_view name, Buffer& data) {
    const Status status = registry.queryValue(key, name, nullptr, data);
    return status == kSuccess && data.text().size() == data.capacity ? kMoreData : status;
}

bool valueExists(IRegistryStore& registry, KeyHandle key, std::string_view name) {
    FixedBuffer<1> probe;
    return !isNotFound(registry.queryValue(key, name, nullptr, probe));
}

int TreeCopy::copy(KeyHandle sourceRoot, std::string_view sourcePath, KeyHandle targetRoot, std::string_view targetPath,
                   bool overwrite) {
    sourceRoot_ = sourceRoot;
    targetRoot_ = targetRoot;
    sourcePath_ = sourcePath;
    targetPath_ = targetPath;
    return copyBelow(overwrite);
}

int TreeCopy::copyBelow(bool overwrite) {
    OwnedKey source(registry_);
    OwnedKey target(registry_);
    if (checkPathLength(sourcePath_) != kSuccess || checkPathLength(targetPath_) != kSuccess ||
        registry_.openKey(sourceRoot_, sourcePath_, kKeyRead, source.receive()) != kSuccess ||
        registry_.createKey(targetRoot_, targetPath_, {}, kKeyCopyTarget, target.receive()) != kSuccess) {
        return 0;
    }
    return copySubkeys(source.get(), target.get(), overwrite) && copyValues(source.get(), target.get(), overwrite);
}

int TreeCopy::copySubkeys(KeyHandle source, KeyHandle target, bool overwrite) {
    const std::size_t sourceLength = sourcePath_.size();
    const std::size_t targetLength = targetPath_.size();
    for (std::uint32_t index = 0;; ++index) {
        const Status found = registry_.enumerateKey(source, index, name_, &class_);
        if (found != kSuccess) {
            return isEndOfItems(found);
        }
        OwnedKey made(registry_);
        if (registry_.createKey(target, name_.view(), class_.view(), kKeyFull, made.receive()) != kSuccess) {
            return 0;
        }
        made.reset();
        sourcePath_.append(1, '\\').append(name_.view());
        targetPath_.append(1, '\\').append(name_.view());
        if (copyBelow(overwrite) == 0) {
            return 0;
        }
        sourcePath_.resize(sourceLength);
        targetPath_.resize(targetLength);
    }
}

int TreeCopy::copyValues(KeyHandle source, KeyHandle target, bool overwrite) {
    for (std::uint32_t index = 0;; ++index) {
        ValueType type{};
        const Status found = registry_.enumerateValue(source, index, valueName_, &type, &data_);
        if (found != kSuccess) {
            return isEndOfItems(found);
        }
        if (!overwrite && valueExists(registry_, target, valueName_.view())) {
            continue;
        }
        if (registry_.setValue(target, valueName_.view(), type, data_.view()) != kSuccess) {
            return 0;
        }
    }
}

Status deleteTree(IRegistryStore& registry, KeyHandle root, std::string_view path, AccessMask view,
                  std::string_view copyName, std::string_view sparedSubkey) {
    if (path.empty()) {
        return kBadKey;
    }
    std::string extended(path);
    return TreeDeletion(registry, root, view, copyName, sparedSubkey).run(extended);
}

}  // namespace kz7
