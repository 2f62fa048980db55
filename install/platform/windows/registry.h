// The registry port on the Windows registry. Texts are UTF-16 there, names and data of the text types alike.
#pragma once

#include <array>
#include <vector>

#include "install/platform/registry_store.h"

namespace kz7 {

class WindowsRegistry final : public IRegistryStore {
public:
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

    // Every call is seen by others at once.
    Status commit() override { return kSuccess; }

private:
    // Follows the first names of a path that is too long for one call, so that the rest below `parent` is not.
    // `base` owns the key where it then starts.
    Status shorten(KeyHandle& parent, std::string_view& path, AccessMask view, bool create, OwnedKey& base);

    template <typename Call>
    Status readData(Call call, unsigned long& size);
    Status giveValue(std::uint32_t nativeType, std::uint32_t size, ValueType* type, Buffer& data);

    static constexpr std::uint32_t kNameRoom = 32767;  // characters
    static constexpr std::size_t kFirstRoom = 4096;    // bytes
    std::array<wchar_t, kNameRoom> name_;
    std::array<wchar_t, kNameRoom> class_;
    std::vector<unsigned char> room_ = std::vector<unsigned char>(kFirstRoom);
};

}  // namespace kz7
