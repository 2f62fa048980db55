// Writes registry values one row at a time and tells about each: the steps of every flow that lays out keys.
#pragma once

#include <array>
#include <span>
#include <string_view>

#include "install/platform/registry_store.h"
#include "install/src/registry/report.h"

namespace kz7 {

// Stands in a table for the location that the command was given.
inline constexpr const char* kLocation = nullptr;

// One text value of a layout. `key` is below the root that the flow writes under; the empty name is the
// key's default value.
struct LayoutRow {
    std::string_view key;
    std::string_view name;
    const char* data;
};

class RowWriter {
public:
    RowWriter(IRegistryStore& registry, Report& report) : registry_(registry), report_(report) {}

    // Announces and writes one value; a failure is reported and returned. `path` is substituted already.
    Status write(std::string_view path, std::string_view name, std::string_view data);

    // Writes a layout under `root`, which may hold the copy-name placeholder, until a row fails.
    Status writeLayout(std::span<const LayoutRow> rows, std::string_view root, std::string_view copyName,
                       std::string_view location);

private:
    IRegistryStore& registry_;
    Report& report_;
};

}  // namespace kz7
