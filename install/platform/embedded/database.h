// A thin owner of one SQLite connection and its prepared statements. Results are SQLite's own codes; the
// registry store turns them into the platform's numbers.
#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace kz7 {

// A prepared statement in use: bound from 1, stepped, and reset when it goes out of scope, so that none
// stays open between two calls of a port (an open one makes the next BEGIN IMMEDIATE fail at once after
// another writer's commit).
class Query {
public:
    // `error` is what preparing the statement gave; the steps answer it.
    Query(sqlite3_stmt* statement, int error) : statement_(statement), error_(error) {}
    Query(const Query&) = delete;
    Query& operator=(const Query&) = delete;
    ~Query() { sqlite3_reset(statement_); }

    // Texts are bound without a copy: they must outlive the steps.
    Query& bind(std::int64_t number);
    Query& bind(std::string_view text);
    Query& bindBytes(std::string_view bytes);

    // SQLITE_ROW, SQLITE_DONE or an error.
    int step();

    std::int64_t number(int column) const { return sqlite3_column_int64(statement_, column); }
    std::string_view bytes(int column) const;

private:
    sqlite3_stmt* statement_;
    int bound_ = 0;
    int error_;
};

struct ConnectionCloser {
    void operator()(sqlite3* connection) const { sqlite3_close_v2(connection); }
};
using Connection = std::unique_ptr<sqlite3, ConnectionCloser>;

struct StatementCloser {
    void operator()(sqlite3_stmt* statement) const { sqlite3_finalize(statement); }
};
using Statement = std::unique_ptr<sqlite3_stmt, StatementCloser>;

// Runs statements without results; the first error ends them.
int execute(sqlite3* connection, const char* sql);

// The first column of the statement's first row, as a number.
int queryNumber(sqlite3* connection, const char* sql, std::int64_t& number);

// Copies a whole database, as the source's transaction sees it, into a new one in memory. An error belongs to the
// source.
int copyToMemory(sqlite3* source, Connection& memory);

}  // namespace kz7
