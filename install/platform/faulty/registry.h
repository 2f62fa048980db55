// A registry whose chosen call fails.
#pragma once

#include "install/platform/faulty/fault_counter.h"
#include "install/platform/registry_store.h"

namespace kz7 {

class FaultyRegistry final : public IRegistryStore {
public:
    FaultyRegistry(IRegistryStore& real, FaultCounter& faults) : real_(real), faults_(faults) {}

    Status openKey(KeyHandle parent, std::string_view path, AccessMask access, KeyHandle& key) override {
        return unlessFailing(faults_, "openKey", [&] { return real_.openKey(parent, path, access, key); });
    }
    Status createKey(KeyHandle parent, std::string_view path, std::string_view keyClass, AccessMask access,
                     KeyHandle& key) override {
        return unlessFailing(faults_, "createKey",
                             [&] { return real_.createKey(parent, path, keyClass, access, key); });
    }
    Status closeKey(KeyHandle key) override {
        return closingAnyway(faults_, "closeKey", [&] { return real_.closeKey(key); });
    }
    Status queryValue(KeyHandle key, std::string_view name, ValueType* type, Buffer& data) override {
        return unlessFailing(faults_, "queryValue", [&] { return real_.queryValue(key, name, type, data); });
    }
    Status setValue(KeyHandle key, std::string_view name, ValueType type, std::string_view data) override {
        return unlessFailing(faults_, "setValue", [&] { return real_.setValue(key, name, type, data); });
    }
    Status deleteValue(KeyHandle key, std::string_view name) override {
        return unlessFailing(faults_, "deleteValue", [&] { return real_.deleteValue(key, name); });
    }
    Status enumerateKey(KeyHandle key, std::uint32_t index, Buffer& name, Buffer* keyClass) override {
        return unlessFailing(faults_, "enumerateKey", [&] { return real_.enumerateKey(key, index, name, keyClass); });
    }
    Status enumerateValue(KeyHandle key, std::uint32_t index, Buffer& name, ValueType* type, Buffer* data) override {
        return unlessFailing(faults_, "enumerateValue",
                             [&] { return real_.enumerateValue(key, index, name, type, data); });
    }
    Status deleteKey(KeyHandle parent, std::string_view path, AccessMask view) override {
        return unlessFailing(faults_, "deleteKey", [&] { return real_.deleteKey(parent, path, view); });
    }
    Status commit() override {
        return unlessFailing(faults_, "commit", [&] { return real_.commit(); });
    }

private:
    IRegistryStore& real_;
    FaultCounter& faults_;
};

}  // namespace kz7
