// What the commands that judge a machine know of it: copies, aliases and services of both registry views, read once and
// in linear time.
#pragma once

#include <array>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/text.h"
#include "install/src/copies/alias_rewrite.h"
#include "install/src/registry/copy_layout.h"
#include "install/src/registry/key_reader.h"

namespace kz7 {

struct ViewRow {
    std::string_view name;
    std::string_view copies;  // the key of its copies
};
inline constexpr std::array<ViewRow, 2> kViews = {
    {{"native", layout::kCopies}, {"32-bit", layout::kCopies32}},
};
inline constexpr std::size_t kNative = 0;
inline constexpr std::size_t kOther = 1;  // the 32-bit view

struct CopyInView {
    std::string name;  // as the view spells it
    std::string location;
    InstallCopyInfo info;

    // The text of each row of copyRows(), empty if the product cannot read it; none: the row does not exist. Without
    // Depth::whole, only the rows of the location and of the version are read.
    std::vector<std::optional<std::string>> rows;
    std::optional<std::string> fixLevel;
};

struct ServiceRow {
    std::string name;
    std::string copy;     // that its name belongs to
    std::string program;  // ImagePath, without quotation marks and arguments
    bool isQuoted = false;
    std::uint32_t start = 0;
};

struct CopyRow {
    std::array<std::optional<CopyInView>, kViews.size()> views;
    std::size_t service = std::string::npos;  // in the list of services; none: no service has the copy's name

    // A copy that is in the 32-bit view only was removed.
    bool isRemoved() const { return !views[kNative]; }
    const CopyInView& shown() const { return *views[isRemoved() ? kOther : kNative]; }
    const std::string& name() const { return shown().name; }
    bool isValid() const { return !isRemoved() && views[kNative]->info.isValid(); }
};

struct AliasValue {
    std::string text;
    bool isText = true;       // else no reader gets the name of a copy
    bool isReachable = true;  // by the walk of the rewrite
};

struct AliasRow {
    std::string prefix;  // as stored, or as a rewrite would write it
    std::array<std::optional<AliasValue>, kViews.size()> values;
    std::optional<std::string> should;  // none: the next rewrite deletes it where its walk reaches it
    std::string version;                // of the copy that it should name
    bool exact = false;
};

struct InterruptedRun {
    std::string number;
    std::string command;
};

struct MachineState {
    std::array<bool, kViews.size()> hasView{};           // the key of the copies exists
    std::array<std::string, kViews.size()> defaultCopy;  // the default value of that key
    std::vector<CopyRow> copies;                         // by upper-cased name
    std::map<std::string, AliasRow> aliases;             // all values of the copies' keys, by upper-cased name
    std::vector<ServiceRow> services;                    // by upper-cased name
    std::vector<std::string> savedProperties;            // the keys below HKEY_USERS
    bool hasBackup = false;                              // of a migration
    bool hasMarker = false;                              // of version 9, in the product's own components
    std::string store;                                   // its name, if it was examined
    std::vector<std::string> damages;                    // of the store
    std::vector<InterruptedRun> interruptedRuns;         // those that nobody took back or repeated; the same

    const CopyRow* find(std::string_view name) const;
    bool isDefault(const CopyRow& copy) const { return equalsIgnoreCase(copy.name(), defaultCopy[kNative]); }
};

// `copies` reads the copies with their locations and versions, and the aliases; `whole` everything.
enum class Depth { copies, whole };

// On failure `key` names the key that cannot be read.
Status readMachine(IRegistryStore& registry, Depth depth, MachineState& machine, std::string& key);

// The program of a service's command, without quotation marks.
std::string_view programOf(std::string_view command);

// Whether a version text is one that the prefix may name.
bool hasPrefix(std::string_view version, std::string_view prefix);

// The copies that a prefix may name, highest first.
std::vector<const CopyRow*> candidatesOf(const MachineState& machine, std::string_view prefix);

}  // namespace kz7
