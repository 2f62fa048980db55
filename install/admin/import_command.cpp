#include "install/admin/import_command.h"

#include <CLI/CLI.hpp>
#include <cstring>

#include "install/admin/input_file.h"
#include "install/admin/reg_text.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

Answer importFile(Admin& admin, const std::string& path) {
    if (!admin.open(false)) {
        return kAnswerFault;
    }
    const std::string shown = path == "-" ? "standard input" : shownText(path);
    std::string file;
    if (const int error = readInput(path, file); error != 0) {
        return admin.fault(shown + ": " + std::strerror(error));
    }
    std::vector<KeyChange> changes;
    TextFault bad;
    if (!parseRegText(file, changes, bad)) {
        return admin.fault(compose("%s:%u: %s", {shown, bad.line, bad.reason}));
    }
    std::uint32_t line = 0;
    Status status = applyChanges(admin.registry(), changes, line);
    if (status != kSuccess) {
        return admin.storeFault(compose("%s:%u: this cannot be done", {shown, line}), status);
    }
    status = admin.registry().commit();
    if (status != kSuccess) {
        return admin.storeFault(shown + ": what it asks for cannot be kept", status);
    }
    std::size_t values = 0;
    for (const KeyChange& change : changes) {
        values += change.values.size();
    }
    return admin.write(compose(
        "imported %s into %s: %u keys, %u values\n",
        {shown, admin.storeLine(), static_cast<std::uint32_t>(changes.size()), static_cast<std::uint32_t>(values)}));
}

}  // namespace

void addImportCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("import", "Do what a file of registry-editor text asks for");
    auto path = std::make_shared<std::string>();
    command->add_option("FILE", *path, "The file; \"-\" is standard input")->required();
    command->callback([&admin, path] { admin.answer = [&admin, path] { return importFile(admin, *path); }; });
}

}  // namespace kz7
