// The installer runtime's list of the installed copies, in registry order. A version-8 installation counts as a copy.
// The removal of a copy decides by it how much to delete.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "install/platform/console.h"
#include "install/platform/registry_store.h"
#include "install/platform/text.h"
#include "install/src/copies/ilist.h"

namespace kz7 {

class InstallCopy {
public:
    // clang-format off
    static constexpr std::uint32_t kValid        = 0;
    static constexpr std::uint32_t kUnreadable   = 1;  // the key or its path name could not be read
    static constexpr std::uint32_t kNoComponents = 2;  // built for the 32-bit view, which has no components
    // clang-format on

    InstallCopy(IRegistryStore& registry, std::string_view copyName, bool view32, bool view64);
    virtual ~InstallCopy() = default;

    std::string_view name() const { return name_; }
    std::string_view copyName() const { return copyName_.view(); }  // cut to 64 characters
    std::string_view installPath() const { return installPath_.view(); }
    std::string_view keyPath() const { return keyPath_.view(); }
    bool isPerUser() const { return perUser_; }
    std::uint32_t status() const { return status_; }
    ILIST<char>& components() { return components_; }

private:
    void read(IRegistryStore& registry);
    void readComponents(IRegistryStore& registry, const std::string& base);

    std::string name_;
    FixedText<65> copyName_;
    FixedText<256> installPath_;
    FixedText<256> keyPath_;  // for display; the key itself is opened by its whole path
    bool version8_;
    bool perUser_ = false;
    AccessMask view32_;
    AccessMask view64_;
    std::uint32_t status_ = kValid;
    ILIST<char> components_;
};

class InstallCopyList : public ILIST<InstallCopy> {
public:
    // Never fails as a whole; see status(). Copies that cannot be read are left out and reported on the debugger
    // output.
    InstallCopyList(IRegistryStore& registry, IDebugOutput& debug, bool view32, bool view64);

    // The copy of that name, compared without regard to case; null for none or a null name. A walk in progress keeps
    // its position.
    InstallCopy* findByName(const char* name);

    // 0 when the list was built completely, 1 when building failed part way.
    std::uint32_t status() const { return status_; }

    // The element of a version-8 installation, or null.
    const InstallCopy* version8Copy() const { return version8Copy_; }

private:
    bool hasVersion8(IRegistryStore& registry) const;
    void build(IRegistryStore& registry, IDebugOutput& debug);

    AccessMask view32_;
    AccessMask view64_;
    const InstallCopy* version8Copy_ = nullptr;
    std::uint32_t status_ = 0;
};

}  // namespace kz7
