#include <CLI/CLI.hpp>

#include "install/admin/commands/commands.h"
#include "install/admin/formats/reg_text.h"
#include "install/admin/given_name.h"
#include "install/admin/input_file.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

Answer importFile(Admin& admin, const std::string& path) {
    if (!admin.open(false)) {
        return kAnswerFault;
    }
    InputFile file(admin, path);
    if (const Answer answer = file.read(); answer != kAnswerYes) {
        return answer;
    }
    std::vector<KeyChange> changes;
    TextFault bad;
    if (!parseRegText(file.bytes(), changes, bad)) {
        return file.badLine(bad.line, bad.reason);
    }
    std::uint32_t line = 0;
    Status status = applyChanges(admin.registry(), changes, line);
    if (status != kSuccess) {
        return admin.storeFault(compose("cannot apply: %s:%u", {file.shown(), line}), status);
    }
    status = admin.registry().commit();
    if (status != kSuccess) {
        return admin.storeFault("cannot save changes: " + file.shown(), status);
    }
    std::size_t values = 0;
    for (const KeyChange& change : changes) {
        values += change.values.size();
    }
    return admin.write(compose("imported %s into %s: %u keys, %u values\n",
                               {file.shown(), admin.storeLine(), static_cast<std::uint32_t>(changes.size()),
                                static_cast<std::uint32_t>(values)}));
}

}  // namespace

void addImportCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("import", "Do what a file of registry-editor text asks for");
    auto path = std::make_shared<std::string>();
    command->add_option("FILE", *path, "The file; \"-\" is standard input")->required()->check(givenName());
    command->callback([&admin, path] { admin.answer = [&admin, path] { return importFile(admin, *path); }; });
}

}  // namespace kz7
