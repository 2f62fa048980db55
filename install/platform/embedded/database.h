// Owns one SQLite connection and its prepared statements. Results are SQLite's codes; the registry store translates
// them.
#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace kz7 {

// A prepared statement in use: parameters are bound from 1, then it is stepped, and reset when it goes out of scope. No
// statement stays open between two calls of a port: after another program's commit an open one makes the next BEGIN
// IMMEDIATE fail at once.
class Query {
public:
    // `error` is the result of preparing the statement; each step returns it.
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

// Runs statements without results until one fails.
int execute(sqlite3* connection, const char* sql);

// The first column of the statement's first row, as a number.
int queryNumber(sqlite3* connection, const char* sql, std::int64_t& number);

// The first column of every row of a statement, as texts.
int queryTexts(sqlite3* connection, const char* sql, std::vector<std::string>& texts);

// Replaces the content of a database by that of another, as the transaction of the source sees it. The target has the
// error.
int copyDatabase(sqlite3* source, sqlite3* target);

// Copies a whole database to a new one in memory. The source has the error.
int copyToMemory(sqlite3* source, Connection& memory);

}  // namespace kz7
