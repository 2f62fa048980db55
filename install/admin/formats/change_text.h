// Change sets as people, programs and the registry editor read them.
#pragma once

#include <string>

#include "install/admin/formats/json_text.h"
#include "install/src/registry/change_set.h"

namespace kz7 {

// A line for each value that differs, each key without values and each service, marked + (new), - (gone) or
// ~ (different); a change that is the same in both registry views is one line. `isColoured`: for a terminal.
std::string changeText(const ChangeSet& changes, bool isColoured);

// The key of a change, with the name of its value.
std::string shownRow(const Change& change);

// One line of such a text.
std::string markedLine(char mark, const std::string& text, bool isColoured);

// "changed: 27 values, 12 keys, 1 service" or "unchanged"; `verb` stands before the colon.
std::string changeSummary(const ChangeCounts& counts, std::string_view verb = "changed");

// A JSON array; docs/json.md has the fields.
void appendChanges(const ChangeSet& changes, JsonWriter& json);

// The body of a registry-editor file that makes these changes.
std::string changeRegText(const ChangeSet& changes);

}  // namespace kz7
