#include "install/admin/import_command.h"

#include <CLI/CLI.hpp>
#include <cerrno>
#include <cstdio>
#include <cstring>

#include "install/admin/reg_text.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

// The whole of a file, or of standard input for "-"; 0 or the error of the call that failed.
int readFile(const std::string& path, std::string& bytes) {
    std::FILE* file = path == "-" ? stdin : std::fopen(path.c_str(), "rb");
    if (file == nullptr) {
        return errno;
    }
    char piece[1 << 14];
    errno = 0;
    for (std::size_t size = 0; (size = std::fread(piece, 1, sizeof piece, file)) != 0;) {
        bytes.append(piece, size);
    }
    const int error = std::ferror(file) == 0 ? 0 : errno;
    if (file != stdin) {
        std::fclose(file);
    }
    return error;
}

Answer importFile(Admin& admin, const std::string& path) {
    if (!admin.open(false)) {
        return kAnswerFault;
    }
    const std::string shown = path == "-" ? "standard input" : shownText(path);
    std::string file;
    if (const int error = readFile(path, file); error != 0) {
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
