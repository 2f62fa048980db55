#include "install/admin/commands/commands.h"
#include "install/admin/formats/value_type.h"
#include "install/admin/key_json.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kIndent = "  ";

void appendTreeKey(const KeyRecord& key, std::string& text) {
    std::string indent;
    for (std::size_t depth = 0; depth < key.depth; ++depth) {
        indent += kIndent;
    }
    const std::string_view name(key.name);
    text += indent + shownText(key.depth == 0 ? name : name.substr(name.find_last_of('\\') + 1));
    if (!key.keyClass.empty()) {
        text += " (class \"" + shownText(key.keyClass) + "\")";
    }
    if (key.status != kSuccess) {
        text += compose(" (cannot be read: error %u)", {key.status});
    }
    text += '\n';
    for (const KeyValue& value : key.values) {
        text.append(indent).append(kIndent);
        text += value.name.empty() ? "@" : '"' + shownText(value.name) + '"';
        text += ' ' + typeName(value.type) + shownData(value.type, value.data) + '\n';
    }
}

struct TreeOptions {
    std::string key;
};

Answer showTree(Admin& admin, const TreeOptions& options) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    return admin.isJson ? showKeysJson(admin, options.key)
                        : admin.showKeys(options.key, {}, appendTreeKey, {}, Admin::Reading::pages);
}

}  // namespace

void addTreeCommand(Command& program, Admin& admin) {
    auto command = program.add("tree", "Show keys and values for reading");
    auto& options = command.answerWith(admin, showTree);
    command.text("KEY", options.key, "The key to begin at; everything without it");
    command.json(admin);
}

}  // namespace kz7
