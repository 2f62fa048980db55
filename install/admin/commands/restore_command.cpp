#include <CLI/CLI.hpp>

#include "install/admin/change_report.h"
#include "install/admin/commands/commands.h"
#include "install/admin/registry_source.h"

namespace kz7 {
namespace {

struct RestoreOptions : ChangeOptions {
    std::string file;
};

Answer restore(Admin& admin, const RestoreOptions& options) {
    if (!admin.open(options.check, true)) {
        return kAnswerFault;
    }
    const bool isOwn = admin.platform().storeIsOwn();
    RegistrySource file(admin, options.file);
    Snapshot wanted;
    if (const Answer opened = file.open(); opened != kAnswerYes) {
        return opened;
    }
    if (const Answer read = file.readProduct(isOwn, wanted); read != kAnswerYes) {
        return read;
    }
    if (wanted.empty()) {
        return admin.fault("nothing to restore: " + shownText(options.file));
    }
    RegistrySource machine(admin, ".");
    Snapshot live;
    if (const Answer opened = machine.open(); opened != kAnswerYes) {
        return opened;
    }
    if (const Answer read = machine.readProduct(isOwn, live); read != kAnswerYes) {
        return read;
    }
    ChangeRun run;
    run.changes = difference(live, wanted);
    if (!options.check) {
        std::string key;
        Status status =
            applyChangeSet(admin.registry(), isOwn ? nullptr : &admin.platform().services(), run.changes, key);
        if (status != kSuccess) {
            return admin.storeFault("cannot change: " + shownText(key), status);
        }
        status = admin.registry().commit();
        if (status != kSuccess) {
            return admin.storeFault("cannot save changes: " + shownText(options.file), status);
        }
    }
    return showRun(admin, options, run);
}

}  // namespace

void addRestoreCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("restore", "Bring the product's keys and services back to a backup");
    auto options = std::make_shared<RestoreOptions>();
    addChangeOptions(*command, *options);
    command->add_option("FILE", options->file, "A backup, or an export as registry-editor text")->required();
    command->callback([&admin, options] { admin.answer = [&admin, options] { return restore(admin, *options); }; });
}

}  // namespace kz7
