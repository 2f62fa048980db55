#include "install/platform/memory/registry.h"

#include <algorithm>

#include "install/platform/registry_path.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kCallersSid = "S-1-22-1-0";
// Above the numbers of the roots and of the handles of other ports.
constexpr std::uint64_t kFirstHandle = std::uint64_t{1} << 32;

}  // namespace

MemoryRegistry::MemoryRegistry()
    : machine_(std::make_shared<Node>()),
      users_(std::make_shared<Node>()),
      noUser_(std::make_shared<Node>()),
      open_(kFirstHandle) {}

std::vector<MemoryRegistry::NodePointer>::iterator MemoryRegistry::lowerBound(Node& parent, std::string_view fold) {
    return std::lower_bound(parent.subkeys.begin(), parent.subkeys.end(), fold,
                            [](const NodePointer& node, std::string_view wanted) { return node->fold < wanted; });
}

MemoryRegistry::NodePointer MemoryRegistry::child(Node& parent, std::string_view name, bool create) {
    std::string fold = foldUpper(name);
    const auto place = lowerBound(parent, fold);
    if (place != parent.subkeys.end() && (*place)->fold == fold) {
        return *place;
    }
    if (!create) {
        return nullptr;
    }
    auto node = std::make_shared<Node>();
    node->name = name;
    node->fold = std::move(fold);
    node->parent = &parent;
    return *parent.subkeys.insert(place, std::move(node));
}

Status MemoryRegistry::nodeOf(KeyHandle handle, AccessMask needed, NodePointer& node) {
    switch (handle) {
        case KeyHandle::localMachine:
            node = machine_;
            return kSuccess;
        case KeyHandle::users:
            node = users_;
            return kSuccess;
        case KeyHandle::currentUser:
            node = child(*users_, kCallersSid, false);
            node = node == nullptr ? noUser_ : node;
            return kSuccess;
        default:
            break;
    }
    const OpenKey* const open = open_.find(handle);
    if (open == nullptr) {
        return kInvalidHandle;
    }
    if (open->node->deleted) {
        return kKeyDeleted;
    }
    if ((open->access & needed) != needed) {
        return kAccessDenied;
    }
    node = open->node;
    return kSuccess;
}

Status MemoryRegistry::find(KeyHandle parent, std::string_view path, AccessMask access, NodePointer& node) {
    Status status = checkKeyPath(path);
    if (status == kSuccess) {
        status = nodeOf(parent, 0, node);
    }
    const std::string plain = plainKeyPath(parent, path, access);
    std::string_view rest = plain;
    std::string_view name;
    while (status == kSuccess && takeName(rest, name)) {
        node = child(*node, name, false);
        status = node == nullptr ? kFileNotFound : kSuccess;
    }
    return status == kSuccess && node == noUser_ ? kFileNotFound : status;
}

MemoryRegistry::NodePointer MemoryRegistry::writable(const NodePointer& node) {
    return node == noUser_ ? child(*users_, kCallersSid, true) : node;
}

Status MemoryRegistry::openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) {
    NodePointer node;
    const Status status = find(parent, path, access, node);
    if (status == kSuccess) {
        key = open_.give({std::move(node), grantedAccess(access)});
    }
    return status;
}

Status MemoryRegistry::createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                                 KeyHandle& key) {
    NodePointer node;
    Status status = find(parent, path, access, node);
    if (isNotFound(status)) {
        status = nodeOf(parent, 0, node);
        const std::string plain = plainKeyPath(parent, path, access);
        std::string_view rest = plain;
        std::string_view name;
        node = writable(node);
        while (status == kSuccess && takeName(rest, name)) {
            node = child(*node, name, true);
        }
        node->keyClass = keyClass;
    }
    if (status == kSuccess) {
        key = open_.give({std::move(node), grantedAccess(access)});
    }
    return status;
}

Status MemoryRegistry::closeKey(KeyHandle key) {
    const bool isRoot = key == KeyHandle::localMachine || key == KeyHandle::users || key == KeyHandle::currentUser;
    return isRoot || open_.close(key) ? kSuccess : kInvalidHandle;
}

Status MemoryRegistry::nodeForValue(KeyHandle key, AccessMask needed, std::string_view name, NodePointer& node) {
    const Status status = nodeOf(key, needed, node);
    return status == kSuccess ? checkValueName(name) : status;
}

Status MemoryRegistry::queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) {
    NodePointer node;
    if (const Status status = nodeForValue(key, kKeyQueryValue, name, node); status != kSuccess) {
        return status;
    }
    // Deliberate: only ASCII letters compare without case, also in a preview on Windows, which compares all letters so.
    const auto found = node->byName.find(foldUpper(name));
    if (found == node->byName.end()) {
        return kFileNotFound;
    }
    return giveQueried(found->second.type, found->second.data, type, data);
}

Status MemoryRegistry::setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) {
    NodePointer node;
    if (const Status status = nodeForValue(key, kKeySetValue, name, node); status != kSuccess) {
        return status;
    }
    node = writable(node);
    const auto [place, isNew] = node->byName.try_emplace(foldUpper(name));
    Value& value = place->second;
    if (isNew) {
        value.name = name;
        value.place = ++lastPlace_;
        node->inOrder.push_back(&value);
    }
    value.type = type;
    value.data = data;
    return kSuccess;
}

Status MemoryRegistry::deleteValue(KeyHandle key, std::string_view name) {
    NodePointer node;
    if (const Status status = nodeForValue(key, kKeySetValue, name, node); status != kSuccess) {
        return status;
    }
    const auto found = node->byName.find(foldUpper(name));
    if (found == node->byName.end()) {
        return kFileNotFound;
    }
    const auto before = [](const Value* value, std::uint64_t place) { return value->place < place; };
    node->inOrder.erase(std::lower_bound(node->inOrder.begin(), node->inOrder.end(), found->second.place, before));
    node->byName.erase(found);
    return kSuccess;
}

Status MemoryRegistry::enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) {
    NodePointer node;
    if (const Status status = nodeOf(key, kKeyEnumerateSubkeys, node); status != kSuccess) {
        return status;
    }
    if (index >= node->subkeys.size()) {
        return kNoMoreItems;
    }
    const Node& subkey = *node->subkeys[index];
    const Status named = giveName(subkey.name, name);
    const Status classed = keyClass == nullptr ? kSuccess : giveName(subkey.keyClass, *keyClass);
    return named != kSuccess ? named : classed;
}

Status MemoryRegistry::enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) {
    NodePointer node;
    if (const Status status = nodeOf(key, kKeyQueryValue, node); status != kSuccess) {
        return status;
    }
    if (index >= node->inOrder.size()) {
        return kNoMoreItems;
    }
    const Value& value = *node->inOrder[index];
    const Status named = giveName(value.name, name);
    const Status given = data == nullptr ? kSuccess : giveData(value.type, value.data, *data);
    if (named == kSuccess && given == kSuccess && type != nullptr) {
        *type = value.type;
    }
    return named != kSuccess ? named : given;
}

Status MemoryRegistry::deleteKey(KeyHandle parent, std::string_view path, AccessMask view) {
    NodePointer node;
    if (const Status status = find(parent, path, view, node); status != kSuccess) {
        return status;
    }
    if (node->parent == nullptr || !node->subkeys.empty()) {
        return kAccessDenied;
    }
    node->parent->subkeys.erase(lowerBound(*node->parent, node->fold));
    node->deleted = true;
    return kSuccess;
}

Status MemoryRegistry::commit() {
    ++commits_;
    return kSuccess;
}

}  // namespace kz7
