#include "install/admin/commands/commands.h"
#include "install/admin/formats/reg_text.h"
#include "install/admin/key_json.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

struct ExportOptions {
    std::string key;
    bool utf16 = false;
};

// Lines for a terminal. What is escaped here is not read back by an import.
std::string shownLines(std::string_view text) {
    std::string shown;
    for (std::size_t end = 0; (end = text.find('\n')) != std::string_view::npos; text.remove_prefix(end + 1)) {
        shown += shownText(text.substr(0, end)) + '\n';
    }
    return shown;
}

Answer exportKeys(Admin& admin, const ExportOptions& options) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    if (admin.isJson) {
        return showKeysJson(admin, options.key);
    }
    const bool isTerminal = admin.output().terminal;
    if (isTerminal && options.utf16) {
        return admin.fault("cannot write UTF-16: standard output: is a terminal (redirect it to a file)");
    }
    std::string head = regTextHeader();
    return admin.showKeys(
        options.key, options.utf16 ? std::string(kUtf16Mark) + utf16FileText(head) : head,
        [&](const KeyRecord& key, std::string& text) {
            if (isBareRoot(key) || key.status != kSuccess) {
                return;
            }
            std::string shown;
            appendRegText(key, shown);
            text += options.utf16 ? utf16FileText(shown) : isTerminal ? shownLines(shown) : shown;
        },
        {}, Admin::Reading::snapshot);
}

}  // namespace

void addExportCommand(Command& program, Admin& admin) {
    auto command = program.add("export", "Write keys as registry-editor text to standard output");
    auto& options = command.answerWith(admin, exportKeys);
    command.text("KEY", options.key, "The key to begin at; everything without it");
    auto utf16 = command.flag("--utf16", options.utf16, "Write UTF-16 as Windows' own editor does");
    command.json(admin).excludes(utf16);
}

}  // namespace kz7
