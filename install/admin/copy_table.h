// The installed copies as rows and as JSON.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "install/admin/formats/json_text.h"
#include "install/admin/formats/text_table.h"
#include "install/admin/machine.h"
#include "install/platform/service_manager.h"

namespace kz7 {

// Versions between two bounds, or those that begin with a text; compared as texts, as the product compares them.
class VersionRange {
public:
    // "[9.7,9.8)": a square bracket includes its bound, a missing bound does not limit. Without brackets: that version
    // and those that continue it. False: neither.
    bool parse(std::string_view text);
    bool has(std::string_view version) const;

private:
    std::string low_;
    std::string high_;
    bool isPrefix_ = false;
    bool hasLow_ = false;  // the bounds themselves
    bool hasHigh_ = false;
};

struct CopyFilter {
    std::optional<VersionRange> versions;
    std::string view;  // empty: both
    std::string name;  // empty: all
    bool valid = false;
    bool isDefault = false;
};

struct CopyLine {
    const CopyRow* copy = nullptr;
    const CopyInView* shown = nullptr;
    std::string view;
    std::string service = {};  // empty: the copy has no service
    std::string state = {};    // of the service, in words
    bool isDefault = false;
};

// One line for each copy, or with `perView` for each copy in each view. Services are asked for their states.
std::vector<CopyLine> copyLines(const MachineState& machine, IServiceManager& services, const CopyFilter& filter,
                                bool perView);

// A text of a line; `name` is one of kCopyColumns.
std::string copyField(const CopyLine& line, std::string_view name);
inline constexpr std::array<std::string_view, 8> kCopyColumns = {"name",     "view",    "version", "valid",
                                                                 "location", "service", "state",   "default"};

// Without columns: those for people.
std::string copiesText(const std::vector<CopyLine>& lines, const std::vector<std::string>& columns,
                       std::uint32_t width);

// An object for each line; without columns all fields.
void appendCopy(const CopyLine& line, const std::vector<std::string>& columns, JsonWriter& json);
void appendCopies(const std::vector<CopyLine>& lines, const std::vector<std::string>& columns, JsonWriter& json);

void appendAliases(const std::vector<const AliasRow*>& rows, JsonWriter& json);

// The aliases among the values of the copies' keys, and what should be one; `prefix` selects it and what continues it.
std::vector<const AliasRow*> aliasRows(const MachineState& machine, std::string_view prefix = {});

}  // namespace kz7
