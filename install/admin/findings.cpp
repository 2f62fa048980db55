#include "install/admin/findings.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <set>
#include <unordered_map>

#include "install/platform/service_manager.h"
#include "install/platform/text.h"
#include "install/src/add_copy.h"
#include "install/src/services/management_service.h"

namespace kz7 {
namespace {

constexpr std::size_t kLocationLimit = 255;  // characters of the product's own list of copies
constexpr std::string_view kMigratedCopy = "kz7build";

// clang-format off
constexpr std::array kKinds = {
    FindingKind{Reason::aliasGone,          "stale-alias",       "aliases",    Mark::fault,      true,  "alias %s (%s view)",   "names %s, which is not installed; it should name %s",       "kz7admin repair aliases"},
    FindingKind{Reason::aliasLower,         "stale-alias",       "aliases",    Mark::fault,      true,  "alias %s (%s view)",   "names %s, but %s is the highest that begins with it",       "kz7admin repair aliases"},
    FindingKind{Reason::aliasUnmatched,     "stale-alias",       "aliases",    Mark::fault,      true,  "alias %s (%s view)",   "names %s, but no copy has such a version",                  "kz7admin repair aliases"},
    FindingKind{Reason::aliasMissing,       "missing-alias",     "aliases",    Mark::fault,      true,  "alias %s (%s view)",   "does not exist; it should name %s",                         "kz7admin repair aliases"},
    FindingKind{Reason::aliasUnreadable,    "unreadable-alias",  "aliases",    Mark::fault,      true,  "alias %s (%s view)",   "its data is not a text of less than 100 characters",        "kz7admin repair aliases"},
    FindingKind{Reason::aliasNameTooLong,   "unreadable-alias",  "aliases",    Mark::fault,      true,  "alias %s (%s view)",   "its name has 100 characters or more",                       "kz7admin repair aliases"},
    FindingKind{Reason::walkEnds,           "long-name",         "",           Mark::note,       true,  "value %s (%s view)",   "its name has 100 characters or more: -dotnet does not rewrite the aliases after it", "delete the value if nothing needs it"},
    FindingKind{Reason::noLocation,         "no-location",       "copies",     Mark::fault,      true,  "copy %s (%s view)",    "has no location: the tool does not find the copy",          "kz7admin repair copies %s, or kz7InstallReg -addKZ7Copy %s LOCATION"},
    FindingKind{Reason::locationTooLong,    "no-location",       "",           Mark::fault,      true,  "copy %s (%s view)",    "its location has more than 255 characters: the tool does not find the copy", "kz7InstallReg -addKZ7Copy %s LOCATION"},
    FindingKind{Reason::locationsDiffer,    "views-differ",      "copies",     Mark::fault,      true,  "copy %s",              "is at %s for 64-bit programs and at %s for 32-bit programs", "kz7admin repair copies %s"},
    FindingKind{Reason::versionsDiffer,     "views-differ",      "copies",     Mark::fault,      true,  "copy %s",              "is %s for 64-bit programs and %s for 32-bit programs",      "kz7admin repair copies %s"},
    FindingKind{Reason::halfCopy,           "half-copy",         "copies",     Mark::fault,      true,  "copy %s (%s view)",    "lacks %s: an add or a removal did not end",                 "kz7admin repair copies %s, or kz7InstallReg -removeKZ7Copy %s"},
    FindingKind{Reason::invalidVersion,     "invalid-version",   "copies",     Mark::fault,      true,  "copy %s (%s view)",    "has no readable %s: no alias can name it",                  "kz7admin repair copies %s"},
    FindingKind{Reason::serviceWithoutCopy, "orphan-service",    "services",   Mark::fault,      true,  "service %s",           "its copy does not exist: a removal did not end",            "kz7admin repair services %s"},
    FindingKind{Reason::copyWithoutService, "no-service",        "services",   Mark::fault,      true,  "copy %s",              "the service %s does not exist",                             "kz7admin repair services %s"},
    FindingKind{Reason::serviceElsewhere,   "service-elsewhere", "services",   Mark::fault,      true,  "service %s",           "runs %s, but its copy is at %s",                            "kz7admin repair services %s"},
    FindingKind{Reason::serviceShadowed,    "shadowed-service",  "services",   Mark::fault,      true,  "service %s",           "its path has a blank and no quotation marks, so Windows starts %s instead", "kz7admin repair services %s"},
    FindingKind{Reason::serviceDisabled,    "disabled-service",  "services",   Mark::fault,      true,  "service %s",           "is disabled",                                               "kz7admin repair services %s"},
    FindingKind{Reason::savedProperties,    "saved-properties",  "properties", Mark::fault,      true,  "HKEY_USERS\\%s",       "an installation did not end, or is running now",            "kz7admin repair properties"},
    FindingKind{Reason::migrationUnfinished,"half-migration",    "migration",  Mark::fault,      true,  "SOFTWARE\\NVQ\\KZ7BackupV8", "holds a version-8 registry, but no migrated copy exists: -v9 did not end", "kz7admin repair migration --on LOCATION, or --back"},
    FindingKind{Reason::migrationIgnored,   "half-migration",    "migration",  Mark::fault,      true,  "SOFTWARE\\NVQ\\KZ7BackupV8", "is next to the marker of version 9: -v9 would not use it", "kz7admin repair migration --on LOCATION, or --back"},
    FindingKind{Reason::storeDamaged,       "damaged-store",     "",           Mark::fault,      true,  "store %s",             "%s",                                                        "bring a backup back as docs/troubleshooting.md describes"},
    FindingKind{Reason::runInterrupted,     "interrupted-run",   "",           Mark::fault,      true,  "run %s",               "%s did not end",                                            "kz7admin undo %s, or the same command again"},
    FindingKind{Reason::versionOrder,       "text-order",        "",           Mark::note,       true,  "versions %s",          "%s is above %s, because versions are compared as texts",    "none; see docs/deliberate.md"},
    FindingKind{Reason::nameOrder,          "text-order",        "",           Mark::note,       false, "names %s",             "%s is after %s, because names are compared as texts; of equal versions the later name gets the aliases", "none; see docs/deliberate.md"},
    FindingKind{Reason::copyRemoved,        "removed-copy",      "",           Mark::deliberate, false, "copy %s (%s view)",    "was removed; 32-bit programs may still use its key",        "none; see docs/deliberate.md"},
    FindingKind{Reason::aliasOfRemoved,     "removed-alias",     "",           Mark::deliberate, false, "value %s (%s view)",   "names %s, which was removed; the next -dotnet rewrites the aliases", "none; see docs/deliberate.md"},
    FindingKind{Reason::pathWithBlank,      "unquoted-path",     "",           Mark::deliberate, false, "service %s",           "its path has a blank and no quotation marks; Windows tries %s first", "none; see docs/deliberate.md"},
    FindingKind{Reason::noDirectory,        "no-directory",      "",           Mark::absent,     false, "copy %s",              "its location %s does not exist",                            "install the product's files there"},
    FindingKind{Reason::noProgram,          "no-program",        "",           Mark::absent,     false, "service %s",           "its program %s does not exist",                             "install the product's files there"},
};
// clang-format on

// A name as POSIX shells and cmd.exe take it as one word.
std::string quotedWord(const std::string& name) {
    const bool isPlain = !name.empty() && std::all_of(name.begin(), name.end(), [](char c) {
        return std::isalnum(static_cast<unsigned char>(c)) != 0 ||
               std::string_view("._-:\\+,@").find(c) != std::string_view::npos;
    });
    if (isPlain && name.find('\\') == std::string::npos) {
        return name;
    }
    if (name.find_first_of("\"$`!%\\") == std::string::npos) {
        return '"' + name + '"';
    }
    std::string quoted = "'";
    for (const char c : name) {
        quoted += c == '\'' ? std::string("'\\''") : std::string(1, c);
    }
    return quoted + '\'';
}

std::string shownOr(std::string_view text, std::string_view otherwise) {
    return text.empty() ? std::string(otherwise) : shownText(text);
}

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

// Takes a number off a text, without its leading zeros.
std::string_view takeNumber(std::string_view& text) {
    text.remove_prefix(std::min(text.find_first_not_of('0'), text.size()));
    const auto* const end = std::find_if_not(text.begin(), text.end(), isDigit);
    const std::string_view number = text.substr(0, static_cast<std::size_t>(end - text.begin()));
    text.remove_prefix(number.size());
    return number;
}

// Takes a number or a character off both texts and compares them.
int takeAndCompare(std::string_view& left, std::string_view& right) {
    if (isDigit(left.front()) && isDigit(right.front())) {
        const std::string_view one = takeNumber(left);
        const std::string_view two = takeNumber(right);
        return one.size() == two.size() ? one.compare(two) : one.size() < two.size() ? -1 : 1;
    }
    const int order = foldUpper(left.front()) - foldUpper(right.front());
    left.remove_prefix(1);
    right.remove_prefix(1);
    return order;
}

// Compares as people count: runs of digits by their value.
int compareAsNumbers(std::string_view left, std::string_view right) {
    int order = 0;
    while (order == 0 && !left.empty() && !right.empty()) {
        order = takeAndCompare(left, right);
    }
    return order != 0 ? order : static_cast<int>(!left.empty()) - static_cast<int>(!right.empty());
}

void addWord(std::string& list, std::string_view word) {
    list.append(list.empty() ? "" : ", ").append(word);
}

bool isVersionRow(const LayoutRow& row) {
    return row.key == "CurrentVersion" && row.name != "Service Level";
}

// What of a copy's layout a view lacks. Missing versions alone, or a missing location, are kinds of their own.
struct Missing {
    explicit Missing(const CopyInView& copy) {
        for (std::size_t row = 0; row < copy.rows.size(); ++row) {
            const LayoutRow& layout = copyRows()[row];
            const std::optional<std::string>& text = copy.rows[row];
            if (isVersionRow(layout) && (!text || text->empty())) {
                addWord(versions, layout.name);
            }
            if (text) {
                isBare = false;
                continue;
            }
            isHalf = isHalf || (!isVersionRow(layout) && !layout.key.empty());
            const bool isBoth = !layout.key.empty() && !layout.name.empty();
            addWord(rows, std::string(layout.key) + (isBoth ? "\\" : "") + std::string(layout.name));
        }
        rows = isBare ? "everything" : rows;
    }

    std::string versions;
    std::string rows;
    bool isHalf = false;
    bool isBare = true;
};

class Checker {
public:
    Checker(const MachineState& machine, IFileSystem& files, bool all, std::vector<Finding>& findings)
        : machine_(machine), files_(files), all_(all), findings_(findings) {}

    void run() {
        checkAliases();
        for (const CopyRow& copy : machine_.copies) {
            checkCopy(copy);
        }
        checkOrder();
        for (const ServiceRow& service : machine_.services) {
            checkService(service);
        }
        for (const std::string& key : machine_.savedProperties) {
            add({Reason::savedProperties, {}, key});
        }
        checkMigration();
        for (const std::string& damage : machine_.damages) {
            add({Reason::storeDamaged, {}, machine_.store, kNative, damage});
        }
        for (const InterruptedRun& run : machine_.interruptedRuns) {
            add({Reason::runInterrupted, {}, run.number, kNative, run.command});
        }
    }

private:
    void add(Finding finding) {
        if (all_ || finding.kind().isShown) {
            findings_.push_back(std::move(finding));
        }
    }

    void checkAliases() {
        std::array<bool, kViews.size()> hasAliases{};
        for (const auto& [fold, row] : machine_.aliases) {
            for (std::size_t view = 0; view < kViews.size(); ++view) {
                hasAliases[view] = hasAliases[view] || (row.values[view] && isAliasName(row.prefix));
            }
        }
        for (const auto& [fold, row] : machine_.aliases) {
            for (std::size_t view = 0; view < kViews.size(); ++view) {
                if (auto finding = judgeAlias(machine_, row, view, hasAliases[view])) {
                    add(std::move(*finding));
                }
            }
        }
    }

    void checkCopy(const CopyRow& copy) {
        if (copy.isRemoved()) {
            add({Reason::copyRemoved, copy.name(), copy.name(), kOther});
            return;
        }
        for (std::size_t view = 0; view < kViews.size(); ++view) {
            checkRows(copy, view);
        }
        if (copy.views[kOther]) {
            compareViews(copy);
        }
        const std::string& location = copy.shown().location;
        if (copy.service == std::string::npos && !location.empty()) {
            add({Reason::copyWithoutService, copy.name(), copy.name(), kNative,
                 std::string(managementServiceName(copy.name()).view())});
        }
        if (all_ && !location.empty() && isNotFound(files_.probe(location))) {
            add({Reason::noDirectory, copy.name(), copy.name(), kNative, location});
        }
    }

    void checkRows(const CopyRow& copy, std::size_t view) {
        const std::string& name = copy.name();
        if (!copy.views[view]) {
            add({Reason::halfCopy, name, name, view, "everything"});
            return;
        }
        const Missing missing(*copy.views[view]);
        if (missing.isHalf) {
            add({Reason::halfCopy, name, name, view, missing.rows});
            return;
        }
        if (!missing.versions.empty()) {
            add({Reason::invalidVersion, name, name, view, missing.versions});
        }
        const std::string& location = copy.views[view]->location;
        if (location.empty()) {
            add({Reason::noLocation, name, name, view});
        } else if (!fitsCharacters(location, kLocationLimit)) {
            add({Reason::locationTooLong, name, name, view});
        }
    }

    void compareViews(const CopyRow& copy) {
        const CopyInView& native = *copy.views[kNative];
        const CopyInView& other = *copy.views[kOther];
        bool isElsewhere = false;
        bool isOther = native.fixLevel && native.fixLevel != other.fixLevel;
        for (std::size_t row = 0; row < native.rows.size(); ++row) {
            if (native.rows[row] && other.rows[row] && *native.rows[row] != *other.rows[row]) {
                const LayoutRow& layout = copyRows()[row];
                isElsewhere = isElsewhere || layout.data == kLocation;
                isOther = isOther || (layout.key == "CurrentVersion" && !other.rows[row]->empty());
            }
        }
        if (isElsewhere && !native.location.empty() && !other.location.empty()) {
            add({Reason::locationsDiffer, copy.name(), copy.name(), kNative, placesOf(native), placesOf(other)});
        }
        if (isOther && native.info.isValid() && other.info.isValid()) {
            add({Reason::versionsDiffer, copy.name(), copy.name(), kNative, versionOf(native), versionOf(other)});
        }
    }

    // The location, with that of the global profile where it is another.
    static std::string placesOf(const CopyInView& copy) {
        for (std::size_t row = 1; row < copy.rows.size(); ++row) {
            if (copyRows()[row].data == kLocation && copy.rows[row] && *copy.rows[row] != copy.location) {
                return copy.location + " (" + std::string(copyRows()[row].name) + ' ' + *copy.rows[row] + ')';
            }
        }
        return copy.location;
    }

    static std::string versionOf(const CopyInView& copy) {
        for (std::size_t row = 0; row < copy.rows.size(); ++row) {
            if (copyRows()[row].name == "Service Level" && copy.rows[row]) {
                return copy.info.getVersion() + ' ' + *copy.rows[row];
            }
        }
        return copy.info.getVersion();
    }

    // Neighbours in the order of texts that are not in order as numbers.
    void checkOrder() {
        std::vector<std::pair<std::string_view, std::string_view>> texts;
        std::string_view before;
        for (const CopyRow& copy : machine_.copies) {
            if (copy.isValid()) {
                texts.emplace_back(copy.shown().info.getVersion(), copy.name());
                if (all_ && !before.empty() && compareAsNumbers(before, copy.name()) > 0) {
                    addOrder(Reason::nameOrder, copy.name(), before);
                }
                before = copy.name();
            }
        }
        std::sort(texts.begin(), texts.end());
        for (std::size_t next = 1; next < texts.size(); ++next) {
            if (compareAsNumbers(texts[next - 1].first, texts[next].first) > 0) {
                addOrder(Reason::versionOrder, texts[next].first, texts[next - 1].first);
            }
        }
    }

    void addOrder(Reason reason, std::string_view after, std::string_view before) {
        add({reason,
             {},
             std::string(after) + " and " + std::string(before),
             kNative,
             std::string(after),
             std::string(before)});
    }

    void checkService(const ServiceRow& service) {
        const CopyRow* const copy = machine_.find(service.copy);
        if (copy == nullptr || copy->isRemoved()) {
            add({Reason::serviceWithoutCopy, service.copy, service.name});
            return;
        }
        const std::string& location = copy->shown().location;
        if (!location.empty() && !equalsIgnoreCase(service.program, managementServiceProgram(location).view())) {
            add({Reason::serviceElsewhere, copy->name(), service.name, kNative, service.program, location});
        }
        if (service.start == static_cast<std::uint32_t>(ServiceStart::disabled)) {
            add({Reason::serviceDisabled, copy->name(), service.name});
        }
        checkBlanks(service, *copy);
        if (all_ && !service.program.empty() && isNotFound(files_.probe(service.program))) {
            add({Reason::noProgram, copy->name(), service.name, kNative, service.program});
        }
    }

    // Windows ends the name of a program at the first blank where a program of that name exists.
    void checkBlanks(const ServiceRow& service, const CopyRow& copy) {
        if (service.isQuoted) {
            return;
        }
        std::string first;
        for (std::size_t blank = service.program.find(' '); blank != std::string::npos;
             blank = service.program.find(' ', blank + 1)) {
            const std::string shadow = service.program.substr(0, blank) + ".exe";
            first = first.empty() ? shadow : first;
            if (exists(shadow)) {
                add({Reason::serviceShadowed, copy.name(), service.name, kNative, shadow});
                return;
            }
        }
        if (!first.empty()) {
            add({Reason::pathWithBlank, copy.name(), service.name, kNative, first});
        }
    }

    bool exists(const std::string& path) {
        const auto [place, isNew] = probed_.try_emplace(path, false);
        if (isNew) {
            place->second = files_.probe(path) == kSuccess;
        }
        return place->second;
    }

    void checkMigration() {
        if (machine_.hasBackup && machine_.hasMarker) {
            add({Reason::migrationIgnored});
        } else if (machine_.hasBackup && machine_.find(kMigratedCopy) == nullptr) {
            add({Reason::migrationUnfinished});
        }
    }

    const MachineState& machine_;
    IFileSystem& files_;
    bool all_;
    std::vector<Finding>& findings_;
    std::unordered_map<std::string, bool> probed_;
};

// An alias that does not name the copy that it should name.
std::optional<Finding> judgeNamed(const AliasRow& row, std::size_t view, const CopyRow* named) {
    const AliasValue& value = *row.values[view];
    const std::string should = row.should.value_or(std::string{});
    if (!value.isText) {
        return Finding{Reason::aliasUnreadable, {}, row.prefix, view};
    }
    if (named == nullptr) {
        return Finding{Reason::aliasGone, {}, row.prefix, view, value.text, should};
    }
    if (should.empty()) {
        return Finding{Reason::aliasUnmatched, {}, row.prefix, view, value.text};
    }
    // Of two equal versions either may have it: an add does not rewrite the aliases.
    if (named->isValid() && named->shown().info.getVersion() == row.version) {
        return {};
    }
    return Finding{Reason::aliasLower, {}, row.prefix, view, value.text, should};
}

// A text of the table may have fewer placeholders.
std::string fill(std::string_view pattern, const std::string& first, const std::string& second) {
    const std::array<Insert, 2> inserts = {first, second};
    std::string text(composeInto(nullptr, 0, pattern, inserts), '\0');
    composeInto(text.data(), text.size(), pattern, inserts);
    return text;
}

}  // namespace

const FindingKind& Finding::kind() const {
    return kKinds[static_cast<std::size_t>(reason)];
}

std::string Finding::what() const {
    return fill(kind().what, shownText(subject), std::string(kViews[view].name));
}

std::string Finding::why() const {
    return fill(kind().why, shownOr(detail, "nothing"), shownOr(other, "nothing"));
}

std::string Finding::repair() const {
    const std::string word = shownText(quotedWord(copy.empty() ? subject : copy));
    const bool isUnclear = kind().repair.starts_with("kz7admin") && (isRepairWord(copy) || copy.starts_with('-'));
    return fill(kind().repair, isUnclear ? "--copy=" + word : word, word);
}

bool isRepairWord(std::string_view word) {
    return std::any_of(kKinds.begin(), kKinds.end(), [word](const FindingKind& kind) {
        return !kind.group.empty() && (kind.group == word || kind.name == word);
    });
}

std::vector<FindingKind> findingKinds() {
    return {kKinds.begin(), kKinds.end()};
}

std::optional<Finding> judgeAlias(const MachineState& machine, const AliasRow& row, std::size_t view, bool hasAliases) {
    const std::optional<AliasValue>& value = row.values[view];
    if (!value) {
        const bool isMissing = hasAliases && isAliasName(row.prefix) && row.should && !row.should->empty();
        return isMissing ? std::optional(Finding{Reason::aliasMissing, {}, row.prefix, view, *row.should})
                         : std::nullopt;
    }
    if (!fitsCharacters(row.prefix, kAliasNameRoom - 1)) {
        return Finding{isAliasName(row.prefix) ? Reason::aliasNameTooLong : Reason::walkEnds, {}, row.prefix, view};
    }
    const CopyRow* const named = machine.find(value->text);
    if (named != nullptr && named->isRemoved()) {
        return Finding{Reason::aliasOfRemoved, {}, row.prefix, view, value->text};
    }
    if (!isAliasName(row.prefix) || (value->isText && row.should && equalsIgnoreCase(value->text, *row.should))) {
        return {};
    }
    return judgeNamed(row, view, named);
}

std::vector<Finding> findFindings(const MachineState& machine, IFileSystem& files, bool all) {
    std::vector<Finding> findings;
    Checker(machine, files, all, findings).run();
    return findings;
}

std::string_view markName(Mark mark) {
    constexpr std::array<std::string_view, 4> kNames = {"fault", "note", "deliberate", "absent"};
    return kNames[static_cast<std::size_t>(mark)];
}

std::string findingLine(const Finding& finding) {
    const Mark mark = finding.kind().mark;
    return compose("%s%s: %s: %s; repair: %s\n",
                   {finding.kind().name, mark == Mark::fault ? std::string{} : compose(" (%s)", {markName(mark)}),
                    finding.what(), finding.why(), finding.repair()});
}

void appendFindings(const std::vector<Finding>& findings, JsonWriter& json) {
    json.beginArray();
    for (const Finding& finding : findings) {
        json.beginObject().field("kind", finding.kind().name).field("mark", markName(finding.kind().mark));
        json.field("copy", finding.copy).field("subject", finding.subject);
        json.field("what", finding.what()).field("why", finding.why()).field("repair", finding.repair()).end();
    }
    json.end();
}

}  // namespace kz7
