#include "install/admin/formats/change_text.h"

#include <algorithm>
#include <array>
#include <map>
#include <set>
#include <unordered_map>

#include "install/admin/formats/reg_text.h"
#include "install/admin/formats/value_type.h"
#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::string_view kMachine = "HKEY_LOCAL_MACHINE";
constexpr std::string_view kSoftware = "HKEY_LOCAL_MACHINE\\SOFTWARE\\";
constexpr std::string_view kView32 = "Wow6432Node\\";

// The same key in the native view; the name itself where it is not in the 32-bit view.
std::string nativeName(std::string_view key) {
    if (equalsIgnoreCase(key.substr(0, kSoftware.size()), kSoftware) &&
        equalsIgnoreCase(key.substr(kSoftware.size()).substr(0, kView32.size()), kView32)) {
        return std::string(key.substr(0, kSoftware.size())).append(key.substr(kSoftware.size() + kView32.size()));
    }
    return std::string(key);
}

bool sameIn32BitView(const Change& native, const Change& other) {
    return native.kind == other.kind && native.before == other.before && native.after == other.after &&
           native.keyClass == other.keyClass;
}

std::string identityOf(std::string_view key, const Change& change) {
    return foldUpper(key) + (change.isKey() ? std::string("\0K", 2) : std::string("\0V", 2) + foldUpper(change.name));
}

std::string shownKey(std::string_view key) {
    const bool isMachine = key.starts_with(kMachine);
    return (isMachine ? "HKLM" : "") + shownText(key.substr(isMachine ? kMachine.size() : 0));
}

// "before" -> "after", or the one that there is.
std::string shownStates(const Change& change) {
    std::string text;
    if (change.before) {
        text += shownData(change.before->type, change.before->data);
    }
    if (change.before && change.after) {
        const bool sameType = change.before->type == change.after->type;
        text += " ->" + (sameType ? std::string{} : ' ' + typeName(change.after->type));
    }
    return change.after ? text + shownData(change.after->type, change.after->data) : text;
}

char markOf(const Change& change) {
    if (change.isKey()) {
        return change.kind == Change::Kind::keyCreated ? '+' : '-';
    }
    return !change.before ? '+' : !change.after ? '-' : '~';
}

std::string shownName(const std::string& name) {
    return name.empty() ? "@" : '"' + shownText(name) + '"';
}

// Keys that have value changes of their own.
std::set<std::string> keysWithValues(const ChangeSet& changes) {
    std::set<std::string> keys;
    for (const Change& change : changes) {
        if (!change.isKey()) {
            keys.insert(foldUpper(change.key));
        }
    }
    return keys;
}

// The changes that are lines of their own: values name their keys.
std::vector<const Change*> linesOf(const ChangeSet& changes) {
    const std::set<std::string> withValues = keysWithValues(changes);
    std::vector<const Change*> lines;
    for (const Change& change : changes) {
        if (serviceOf(change.key).empty() && !(change.isKey() && withValues.contains(foldUpper(change.key)))) {
            lines.push_back(&change);
        }
    }
    return lines;
}

// The changes of the native view that the 32-bit view has too, each with the other one.
std::map<const Change*, const Change*> sameInBothViews(const std::vector<const Change*>& lines) {
    std::unordered_map<std::string, const Change*> in32BitView;
    for (const Change* const change : lines) {
        if (const std::string native = nativeName(change->key); native != change->key) {
            in32BitView.emplace(identityOf(native, *change), change);
        }
    }
    std::map<const Change*, const Change*> same;
    for (const Change* const change : lines) {
        const auto other = in32BitView.find(identityOf(change->key, *change));
        if (other != in32BitView.end() && sameIn32BitView(*change, *other->second)) {
            same.emplace(change, other->second);
        }
    }
    return same;
}

// The changes of services as lines of their own: the program of one that is new or gone, each value that differs else.
std::string serviceText(const ChangeSet& changes, bool isColoured) {
    std::map<std::string, char> services;  // by upper-cased name, with the mark of the whole service
    for (const Change& change : changes) {
        const std::string_view name = serviceOf(change.key);
        if (!name.empty() && change.isKey() && change.key.ends_with(name)) {
            services[foldUpper(name)] = markOf(change);
        }
    }
    std::string text;
    for (const Change& change : changes) {
        const std::string_view name = serviceOf(change.key);
        if (name.empty() || change.isKey()) {
            continue;
        }
        const auto whole = services.find(foldUpper(name));
        const std::string shown = "service " + shownText(name) + ' ';
        if (whole == services.end()) {
            text += markedLine('~', shown + shownName(change.name) + ' ' + shownStates(change), isColoured);
        } else if (equalsIgnoreCase(change.name, "ImagePath")) {
            text += markedLine(whole->second, shown + shownStates(change), isColoured);
        }
    }
    return text;
}

std::string counted(std::size_t count, std::string_view what) {
    return compose("%u %s%s", {static_cast<std::uint32_t>(count), what, count == 1 ? "" : "s"});
}

// The removal of a key takes everything below it along.
class RemovedTrees {
public:
    explicit RemovedTrees(const ChangeSet& changes) {
        for (const Change& change : changes) {
            if (change.kind == Change::Kind::keyRemoved) {
                keys_.insert(foldUpper(change.key));
            }
        }
    }

    // Whether the removal of another key makes the change.
    bool takeAlong(const Change& change) const {
        if (change.kind == Change::Kind::keyRemoved) {
            return keys_.contains(foldUpper(change.key.substr(0, change.key.find_last_of('\\'))));
        }
        return !change.isKey() && !change.after && keys_.contains(foldUpper(change.key));
    }

private:
    std::set<std::string> keys_;  // folded
};

void appendState(std::string_view field, const std::optional<ValueState>& state, JsonWriter& json) {
    if (state) {
        appendData(state->type, state->data, json.field(field).beginObject());
        json.end();
    }
}

}  // namespace

std::string shownRow(const Change& change) {
    return shownKey(change.key) + (change.isKey() ? "" : ' ' + shownName(change.name));
}

std::string markedLine(char mark, const std::string& text, bool isColoured) {
    // clang-format off
    static constexpr std::array<std::pair<char, std::string_view>, 3> kColours = {{
        {'+', "\x1b[32m"}, {'-', "\x1b[31m"}, {'~', "\x1b[33m"},
    }};
    // clang-format on
    const auto* const colour =
        std::find_if(kColours.begin(), kColours.end(), [mark](const auto& entry) { return entry.first == mark; });
    const std::string line = std::string(1, mark) + ' ' + text;
    return isColoured && colour != kColours.end() ? std::string(colour->second) + line + "\x1b[0m\n" : line + '\n';
}

std::string changeText(const ChangeSet& changes, bool isColoured) {
    const std::vector<const Change*> lines = linesOf(changes);
    const auto both = sameInBothViews(lines);
    std::set<const Change*> folded;
    for (const auto& [native, other] : both) {
        folded.insert(other);
    }
    std::string text;
    for (const Change* const change : lines) {
        if (!folded.contains(change)) {
            const std::string line = shownRow(*change) + (change->isKey() ? "" : ' ' + shownStates(*change));
            text += markedLine(markOf(*change), line + (both.contains(change) ? "  (both views)" : ""), isColoured);
        }
    }
    return text + serviceText(changes, isColoured);
}

std::string changeSummary(const ChangeCounts& counts, std::string_view verb) {
    std::string summary;
    for (const auto& [count, what] :
         {std::pair(counts.values, "value"), {counts.keys, "key"}, {counts.services, "service"}}) {
        if (count != 0) {
            summary += (summary.empty() ? std::string(verb) + ": " : ", ") + counted(count, what);
        }
    }
    return summary.empty() ? "unchanged" : summary;
}

void appendChanges(const ChangeSet& changes, JsonWriter& json) {
    json.beginArray();
    for (const Change& change : changes) {
        const bool isGone = markOf(change) == '-';
        const char* const kind =
            change.isKey() ? (isGone ? "key-removed" : "key-created") : (isGone ? "value-removed" : "value-set");
        json.beginObject().field("kind", kind).field("key", change.key);
        json.field(change.isKey() ? "class" : "name", change.isKey() ? change.keyClass : change.name);
        appendState("before", change.before, json);
        appendState("after", change.after, json);
        json.end();
    }
    json.end();
}

std::string changeRegText(const ChangeSet& changes) {
    const RemovedTrees trees(changes);
    std::string text;
    std::string key;  // of the section that is open
    for (const Change& change : changes) {
        if (trees.takeAlong(change)) {
            continue;
        }
        if (change.kind == Change::Kind::keyRemoved) {
            appendRegKeyRemoval(change.key, text);
            key.clear();
            continue;
        }
        if (change.key != key) {
            appendRegKey(change.key, change.keyClass, text);
            key = change.key;
        }
        if (change.after) {
            appendRegValue({change.name, change.after->type, change.after->data}, text);
        } else if (!change.isKey()) {
            appendRegValueRemoval(change.name, text);
        }
    }
    return text;
}

}  // namespace kz7
