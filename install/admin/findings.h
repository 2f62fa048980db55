// What is not in order on a machine, or only looks so: each kind with its reason and its repair in one table.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "install/admin/formats/json_text.h"
#include "install/admin/machine.h"
#include "install/platform/file_system.h"

namespace kz7 {

enum class Reason {
    aliasGone,
    aliasLower,
    aliasUnmatched,
    aliasMissing,
    aliasUnreadable,
    aliasNameTooLong,
    walkEnds,
    noLocation,
    locationTooLong,
    locationsDiffer,
    versionsDiffer,
    halfCopy,
    invalidVersion,
    serviceWithoutCopy,
    copyWithoutService,
    serviceElsewhere,
    serviceShadowed,
    serviceDisabled,
    savedProperties,
    migrationUnfinished,
    migrationIgnored,
    storeDamaged,
    runInterrupted,
    versionOrder,
    nameOrder,
    copyRemoved,
    aliasOfRemoved,
    pathWithBlank,
    noDirectory,
    noProgram,
};

// `fault` is not in order; the others are: a note is worth knowing, the tool leaves what is deliberate behind on
// purpose, and a fresh add cannot have what is absent.
enum class Mark { fault, note, deliberate, absent };

struct FindingKind {
    Reason reason;
    std::string_view name;   // several reasons may share it
    std::string_view group;  // empty: no repair exists
    Mark mark;
    bool isShown;             // without --all
    std::string_view what;    // inserts: the subject, the view
    std::string_view why;     // inserts: the two details
    std::string_view repair;  // inserts: the copy, as a shell takes it
};

struct Finding {
    Reason reason{};
    std::string copy = {};     // that it belongs to; empty: to none
    std::string subject = {};  // the prefix, copy, service or key
    std::size_t view = kNative;
    std::string detail = {};
    std::string other = {};

    const FindingKind& kind() const;
    std::string what() const;
    std::string why() const;
    std::string repair() const;
};

// All kinds, in the order of Reason.
std::vector<FindingKind> findingKinds();

// Whether a word names a kind that can be repaired, or a group of them.
bool isRepairWord(std::string_view word);

// The findings in the order of the table's groups: aliases, copies, services, the rest. With `all`, also those that are
// shown on request only, for which `files` is asked about locations and programs.
std::vector<Finding> findFindings(const MachineState& machine, IFileSystem& files, bool all);

// What each reader of a prefix gets from a view, if that is wrong.
std::optional<Finding> judgeAlias(const MachineState& machine, const AliasRow& row, std::size_t view, bool hasAliases);

// One line: kind, what, why, repair.
std::string findingLine(const Finding& finding);
void appendFindings(const std::vector<Finding>& findings, JsonWriter& json);

std::string_view markName(Mark mark);

}  // namespace kz7
