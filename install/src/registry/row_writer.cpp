#include "install/src/registry/row_writer.h"

#include <string>

#include "install/src/registry/copy_name.h"
#include "install/src/registry/registry_access.h"

namespace kz7 {
namespace {

constexpr ErrorText kWriteFailed{
    392, "An error occurred while creating the registry key %s under %s with value %s : rc= %d\n"};

}  // namespace

Status RowWriter::write(std::string_view path, std::string_view name, std::string_view data) {
    report_.line("Creating registry key %s under %s with value %s\n", {name, path, data});
    const Status status = setText(registry_, path, name, data);
    if (!succeeded(status)) {
        report_.error(kWriteFailed, {name, path, data, status});
    }
    return status;
}

Status RowWriter::writeLayout(std::span<const LayoutRow> rows, std::string_view root, std::string_view copyName,
                              std::string_view location) {
    Status status = kSuccess;
    for (const LayoutRow& row : rows) {
        std::string path(root);
        if (!row.key.empty()) {
            path.append("\\").append(row.key);
        }
        status = write(substituteCopyName(path, copyName), row.name, row.data == kLocation ? location : row.data);
        if (!succeeded(status)) {
            break;
        }
    }
    return status;
}

}  // namespace kz7
