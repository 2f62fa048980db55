// Writes the registry values of a layout row by row, and reports each.
#pragma once

#include <array>
#include <span>
#include <string_view>

#include "install/platform/registry_store.h"
#include "install/src/registry/report.h"

namespace kz7 {

// The data of a row that holds the location from the command line.
inline constexpr const char* kLocation = nullptr;

// One text value of a layout. `key` is relative to the layout's root; the empty name is the key's default value.
struct LayoutRow {
    std::string_view key;
    std::string_view name;
    const char* data;
};

class RowWriter {
public:
    RowWriter(IRegistryStore& registry, Report& report) : registry_(registry), report_(report) {}

    // Prints and writes one value; a failure is reported and returned. `path` has no placeholder left.
    Status write(std::string_view path, std::string_view name, std::string_view data);

    // Writes the rows below `root`, which may hold the copy-name placeholder, up to the first that fails.
    Status writeLayout(std::span<const LayoutRow> rows, std::string_view root, std::string_view copyName,
                       std::string_view location);

private:
    IRegistryStore& registry_;
    Report& report_;
};

}  // namespace kz7
