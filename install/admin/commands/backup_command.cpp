#include <memory>

#include "install/admin/commands/commands.h"
#include "install/admin/formats/reg_text.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

struct BackupOptions {
    std::string file;
    bool force = false;
};

// The product's keys in the registry of a machine, as its own editor reads them. A key that cannot be read fails the
// backup.
Answer readKeys(Admin& admin, std::string& content) {
    std::vector<KeyStart> starts;
    Status status = findEverything(admin.registry(), false, starts);
    std::string text = regTextHeader();
    const auto append = [&text](const KeyRecord& key) {
        if (key.status == kSuccess) {
            appendRegText(key, text);
        }
        return key.status;
    };
    for (auto start = starts.begin(); status == kSuccess && start != starts.end(); ++start) {
        status = walkKeys(admin.registry(), *start, append);
    }
    if (status != kSuccess) {
        return admin.storeFault("cannot read keys: " + admin.platform().storeName(), status);
    }
    content = std::string(kUtf16Mark) + utf16FileText(text);
    return starts.empty() ? admin.no("nothing to back up: " + admin.platform().storeName()) : kAnswerYes;
}

Answer readStore(Admin& admin, std::string& content) {
    if (!admin.platform().storeIsOwn()) {
        return readKeys(admin, content);
    }
    const Status status = admin.platform().storeImage(content);
    if (isNotFound(status)) {
        return admin.no("nothing to back up: " + shownText(admin.platform().storeName()));
    }
    return status == kSuccess ? kAnswerYes : admin.storeFault("cannot read store", status);
}

Answer backUp(Admin& admin, const BackupOptions& options) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    if (const Answer free = admin.checkFile("backup", options.file); free != kAnswerYes) {
        return free;
    }
    std::string content;
    if (const Answer read = readStore(admin, content); read != kAnswerYes) {
        return read;
    }
    const Answer written = admin.writeFile("backup", options.file, content, options.force);
    if (written != kAnswerYes) {
        return written;
    }
    if (admin.isJson) {
        JsonWriter json = beginDocument();
        return admin.writeJson(json.field("store", admin.platform().storeName()).field("file", options.file));
    }
    return admin.write(compose("backed up %s to %s\n", {admin.storeLine(), shownText(options.file)}));
}

}  // namespace

void addBackupCommand(Command& program, Admin& admin) {
    auto command = program.add("backup", "Write the whole store to one file");
    auto& options = command.answerWith(admin, backUp);
    command.text("FILE", options.file, "The file to make").isRequired().isFileName();
    command.flag("--force", options.force, "Replace an existing file");
    command.json(admin);
}

}  // namespace kz7
