// The store written by hand: the floor of what the registry layer does with it.
#pragma once

#include <cstdlib>
#include <string>
#include <vector>

#include "bench/scratch.h"
#include "install/platform/embedded/store_file.h"

namespace kz7 {

inline void require(bool held) {
    if (!held) {
        std::abort();
    }
}

// The tables of the store and nothing else.
class BareStore {
public:
    explicit BareStore(const Scratch& scratch) {
        StoreFile file(scratch.path(), {});
        require(file.openForWriting(connection_).status == kSuccess);
        addKey_ = prepare("INSERT INTO key (parent, fold, name, class) VALUES (?, ?, ?, '')");
        addValue_ = prepare("INSERT INTO value (key, fold, name, type, data, place) VALUES (?, ?, ?, 1, ?, ?)");
        values_ = prepare("SELECT fold, data, place FROM value WHERE key = ? ORDER BY place");
        deleteValues_ = prepare("DELETE FROM value WHERE key = ?");
        deleteKey_ = prepare("DELETE FROM key WHERE id = ?");
        findKey_ = prepare("SELECT id FROM key WHERE parent = ? AND fold = ?");
    }

    void run(const char* sql) { require(execute(connection_.get(), sql) == SQLITE_OK); }

    std::int64_t addKey(std::int64_t parent, std::string_view name) {
        require(Query(addKey_.get(), SQLITE_OK).bind(parent).bind(name).bind(name).step() == SQLITE_DONE);
        return sqlite3_last_insert_rowid(connection_.get());
    }
    void addValue(std::int64_t key, std::string_view name, std::string_view data, std::int64_t place) {
        require(Query(addValue_.get(), SQLITE_OK).bind(key).bind(name).bind(name).bindBytes(data).bind(place).step() ==
                SQLITE_DONE);
    }
    std::int64_t find(std::int64_t parent, std::string_view name) {
        Query query(findKey_.get(), SQLITE_OK);
        require(query.bind(parent).bind(name).step() == SQLITE_ROW);
        return query.number(0);
    }

    // The hand-written loops: a prepared statement for each level, its cursor kept open.
    void copy(std::int64_t source, std::int64_t target, std::size_t depth = 0) {
        {
            Query values(values_.get(), SQLITE_OK);
            values.bind(source);
            while (values.step() == SQLITE_ROW) {
                addValue(target, values.bytes(0), values.bytes(1), values.number(2));
            }
        }
        Query rows(children(depth), SQLITE_OK);
        rows.bind(source);
        while (rows.step() == SQLITE_ROW) {
            copy(rows.number(0), addKey(target, rows.bytes(1)), depth + 1);
        }
    }
    void remove(std::int64_t key, std::size_t depth = 0) {
        {
            Query rows(children(depth), SQLITE_OK);
            rows.bind(key);
            while (rows.step() == SQLITE_ROW) {
                remove(rows.number(0), depth + 1);
            }
        }
        require(Query(deleteValues_.get(), SQLITE_OK).bind(key).step() == SQLITE_DONE);
        require(Query(deleteKey_.get(), SQLITE_OK).bind(key).step() == SQLITE_DONE);
    }

private:
    Statement prepare(const char* sql) {
        sqlite3_stmt* statement = nullptr;
        require(sqlite3_prepare_v2(connection_.get(), sql, -1, &statement, nullptr) == SQLITE_OK);
        return Statement(statement);
    }

    sqlite3_stmt* children(std::size_t depth) {
        if (depth == children_.size()) {
            children_.push_back(prepare("SELECT id, fold FROM key WHERE parent = ? ORDER BY fold"));
        }
        return children_[depth].get();
    }

    Connection connection_;
    std::vector<Statement> children_;
    Statement addKey_, addValue_, values_, deleteValues_, deleteKey_, findKey_;
};

}  // namespace kz7
