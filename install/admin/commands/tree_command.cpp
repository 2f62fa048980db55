#include <CLI/CLI.hpp>

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

Answer showTree(Admin& admin, const std::string& key, bool isJson) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    return isJson ? showKeysJson(admin, key) : admin.showKeys(key, {}, appendTreeKey, {}, Admin::Reading::pages);
}

}  // namespace

void addTreeCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("tree", "Show keys and values for reading");
    auto key = std::make_shared<std::string>();
    command->add_option("KEY", *key, "The key to begin at; everything without it");
    auto json = std::make_shared<bool>(false);
    command->add_flag("--json", *json, "Write JSON for programs");
    command->callback(
        [&admin, key, json] { admin.answer = [&admin, key, json] { return showTree(admin, *key, *json); }; });
}

}  // namespace kz7
