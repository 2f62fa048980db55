#include "install/admin/commands/tree_command.h"

#include <CLI/CLI.hpp>

#include "install/admin/formats/value_type.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kIndent = "  ";

std::string hexNumber(std::uint64_t number) {
    char text[19];
    std::snprintf(text, sizeof text, "0x%llx", static_cast<unsigned long long>(number));
    return text;
}

// The NUL-terminated texts of the data in quotation marks; notes a missing terminator.
std::string shownTexts(std::string_view data) {
    std::string shown;
    while (!data.empty()) {
        const std::size_t end = data.find('\0');
        shown += " \"" + shownText(data.substr(0, end)) + '"';
        if (end == std::string_view::npos) {
            return shown + " (no NUL terminator)";
        }
        data.remove_prefix(end + 1);
    }
    return shown;
}

std::string shownData(const KeyValue& value) {
    std::uint64_t number = 0;
    switch (value.type) {
        case ValueType::sz:
        case ValueType::expandSz:
        case ValueType::multiSz:
            return shownTexts(value.data);
        default:
            break;
    }
    if (numberOf(value.type, value.data, number)) {
        return " " + std::to_string(number) + " (" + hexNumber(number) + ")";
    }
    std::string shown;
    for (const char c : value.data) {
        shown += ' ';
        appendHex(static_cast<unsigned char>(c), 2, shown);
    }
    return shown;
}

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
        const std::string_view type = typeName(value.type);
        text.append(indent).append(kIndent);
        text += value.name.empty() ? "@" : '"' + shownText(value.name) + '"';
        text += ' ';
        text += type.empty() ? "type " + std::to_string(static_cast<std::uint32_t>(value.type)) : std::string(type);
        text += shownData(value) + '\n';
    }
}

Answer showTree(Admin& admin, const std::string& key) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    return admin.showKeys(key, {}, appendTreeKey, {}, Admin::Reading::pages);
}

}  // namespace

void addTreeCommand(CLI::App& program, Admin& admin) {
    auto* command = program.add_subcommand("tree", "Show keys and values for reading");
    auto key = std::make_shared<std::string>();
    command->add_option("KEY", *key, "The key to begin at; without it everything there is to show");
    command->callback([&admin, key] { admin.answer = [&admin, key] { return showTree(admin, *key); }; });
}

}  // namespace kz7
