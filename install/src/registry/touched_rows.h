// The rows that a run touches, each as it was before and as it is now, and the bytes that keep them in the history.
#pragma once

#include <array>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "install/src/registry/change_set.h"

namespace kz7 {

class TouchedRows {
public:
    TouchedRows() = default;
    TouchedRows(const TouchedRows&) = delete;
    TouchedRows& operator=(const TouchedRows&) = delete;

    struct Row {
        std::string name;
        std::optional<ValueState> before;
        std::optional<ValueState> now;  // of a touched row
        bool isTouched = false;         // else it is as before
        bool isKept = false;            // in a part that was taken

        const std::optional<ValueState>& current() const { return isTouched ? now : before; }
        bool differs() const { return isTouched && now != before; }
    };
    struct Key {
        std::string name;  // full
        std::string classBefore;
        std::string classNow;
        bool before = false;  // whether it exists
        bool now = false;
        bool wasRemoved = false;  // at any time: it may have been created again with another class
        bool isNamed = false;     // as the store spells it, and with its class
        bool isListed = false;    // all values that existed before have a row
        bool isChanged = false;   // since the last part was taken
        bool isKept = false;      // in a part that was taken
        std::vector<Row> rows;

        // The row of that name, without regard to case; null without one.
        Row* find(std::string_view value);
        Row& row(std::string_view value);

        // Without another row of that name.
        void add(KeyValue&& existing);

    private:
        using Places = std::unordered_map<std::string, std::size_t>;
        std::unique_ptr<Places> byFold_;  // of many rows, or for a name beyond ASCII; may lag behind
    };

    // The key of that full name, and whether it had no entry before.
    Key& key(std::string_view fullName, bool& isNew);
    Key* find(std::string_view fullName);

    void set(Key& key, Row& row, std::optional<ValueState> now);
    void create(Key& key, std::string_view keyClass);
    void remove(Key& key);

    // Of a key that was looked at again and not created or removed since.
    void exists(Key& key, bool now);

    // Calls `visit` with a key and those below it that have an entry.
    template <typename Visit>
    void visitTree(std::string_view fullName, Visit visit) {
        const std::string place = walkPlace(fullName);
        for (auto key = keys_.lower_bound(place); key != keys_.end() && key->first.starts_with(place); ++key) {
            if (key->first.size() == place.size() || key->first[place.size()] == '\0') {
                visit(key->second);
            }
        }
    }

    // What differs, in the order of a difference.
    ChangeSet changes() const;
    ChangeCounts counts() const;

    // What changed since the last call, in the form of the history.
    std::string takePart();

    // Makes what a part holds. False: it is not one.
    bool add(std::string_view part);

private:
    void change(Key& key);
    ChangeCounts count() const;
    Key* recent(std::string_view fullName);

    std::map<std::string, Key> keys_;  // by their place in a walk
    std::map<std::string, Key>::iterator last_ = keys_.end();
    std::array<Key*, 2> recent_ =
        {};  // the one that was noted last, and the one that was searched last: often its parent
    std::vector<Key*> changed_;
    mutable std::optional<ChangeCounts> counted_;  // since the last change
};

// One key with some of its rows in the form of the history: all that is known of it, a step that leaves its other rows
// alone, or its removal before it is made.
enum class TouchedForm { whole, step, removal };
void appendTouched(const TouchedRows::Key& key, const std::vector<const TouchedRows::Row*>& rows, TouchedForm form,
                   std::string& part);

}  // namespace kz7
