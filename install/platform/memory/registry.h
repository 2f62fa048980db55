// The registry port in memory, for tests and check mode. Handles are numbers in a table, so that closed handles and
// handles of deleted keys return the same results as elsewhere.
#pragma once

#include <map>
#include <memory>
#include <string>
#include <vector>

#include "install/platform/handle_table.h"
#include "install/platform/registry_store.h"

namespace kz7 {

class MemoryRegistry final : public IRegistryStore {
public:
    MemoryRegistry();

    Status openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) override;
    Status createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                     KeyHandle& key) override;
    Status closeKey(KeyHandle key) override;
    Status queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) override;
    Status setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) override;
    Status deleteValue(KeyHandle key, std::string_view name) override;
    Status enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) override;
    Status enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) override;
    Status deleteKey(KeyHandle parent, std::string_view path, AccessMask view) override;
    Status commit() override;

    // Open handles, including those of deleted keys.
    std::size_t openHandles() const { return open_.size(); }

    std::size_t commits() const { return commits_; }

private:
    struct Value {
        std::string name;
        std::uint64_t place;  // grows with every name that is new in its key
        ValueType type{};
        std::string data;
    };
    struct Node {
        std::string name;
        std::string fold;
        std::string keyClass;
        Node* parent = nullptr;  // valid until the key is deleted
        bool deleted = false;
        std::vector<std::shared_ptr<Node>> subkeys;        // by folded name
        std::map<std::string, Value, std::less<>> byName;  // folded
        std::vector<const Value*> inOrder;                 // by place
    };
    using NodePointer = std::shared_ptr<Node>;
    struct OpenKey {
        NodePointer node;
        AccessMask access;
    };

    static std::vector<NodePointer>::iterator lowerBound(Node& parent, std::string_view fold);
    static NodePointer child(Node& parent, std::string_view name, bool create);
    // The node itself, or the caller's key, which a write creates.
    NodePointer writable(const NodePointer& node);
    // The key of a handle that has the required rights.
    Status nodeOf(KeyHandle handle, AccessMask needed, NodePointer& node);
    Status nodeForValue(KeyHandle key, AccessMask needed, std::string_view name, NodePointer& node);
    Status find(KeyHandle parent, std::string_view path, AccessMask access, NodePointer& node);

    NodePointer machine_;
    NodePointer users_;
    NodePointer noUser_;  // represents the caller's key while it does not exist
    HandleTable<KeyHandle, OpenKey> open_;
    std::uint64_t lastPlace_ = 0;
    std::size_t commits_ = 0;
};

}  // namespace kz7
