#include "install/platform/embedded/database.h"

namespace kz7 {

Query& Query::bind(std::int64_t number) {
    if (error_ == SQLITE_OK) {
        error_ = sqlite3_bind_int64(statement_, ++bound_, number);
    }
    return *this;
}

Query& Query::bind(std::string_view text) {
    if (error_ == SQLITE_OK) {
        error_ = sqlite3_bind_text64(statement_, ++bound_, text.empty() ? "" : text.data(), text.size(), SQLITE_STATIC,
                                     SQLITE_UTF8);
    }
    return *this;
}

Query& Query::bindBytes(std::string_view bytes) {
    if (error_ == SQLITE_OK) {
        error_ =
            sqlite3_bind_blob64(statement_, ++bound_, bytes.empty() ? "" : bytes.data(), bytes.size(), SQLITE_STATIC);
    }
    return *this;
}

int Query::step() {
    return error_ == SQLITE_OK ? sqlite3_step(statement_) : error_;
}

std::string_view Query::bytes(int column) const {
    const void* data = sqlite3_column_blob(statement_, column);
    const int size = sqlite3_column_bytes(statement_, column);
    return data == nullptr ? std::string_view{}
                           : std::string_view(static_cast<const char*>(data), static_cast<std::size_t>(size));
}

int execute(sqlite3* connection, const char* sql) {
    return sqlite3_exec(connection, sql, nullptr, nullptr, nullptr);
}

int queryNumber(sqlite3* connection, const char* sql, std::int64_t& number) {
    sqlite3_stmt* prepared = nullptr;
    int result = sqlite3_prepare_v2(connection, sql, -1, &prepared, nullptr);
    const Statement owner(prepared);
    if (result == SQLITE_OK) {
        result = sqlite3_step(prepared);
    }
    if (result != SQLITE_ROW) {
        return result == SQLITE_DONE ? SQLITE_ERROR : result;
    }
    number = sqlite3_column_int64(prepared, 0);
    return SQLITE_OK;
}

int copyDatabase(sqlite3* source, sqlite3* target) {
    sqlite3_backup* const backup = sqlite3_backup_init(target, "main", source, "main");
    if (backup == nullptr) {
        return sqlite3_errcode(target);
    }
    const int result = sqlite3_backup_step(backup, -1);
    const int finished = sqlite3_backup_finish(backup);
    if (result == SQLITE_DONE) {
        return SQLITE_OK;
    }
    return finished == SQLITE_OK ? result : finished;
}

int queryTexts(sqlite3* connection, const char* sql, std::vector<std::string>& texts) {
    sqlite3_stmt* prepared = nullptr;
    int result = sqlite3_prepare_v2(connection, sql, -1, &prepared, nullptr);
    const Statement owner(prepared);
    while (result == SQLITE_OK && (result = sqlite3_step(prepared)) == SQLITE_ROW) {
        const auto* const text = reinterpret_cast<const char*>(sqlite3_column_text(prepared, 0));
        texts.emplace_back(text == nullptr ? "" : text);
        result = SQLITE_OK;
    }
    return result == SQLITE_DONE ? SQLITE_OK : result;
}

int copyToMemory(sqlite3* source, Connection& memory) {
    sqlite3* opened = nullptr;
    int result = sqlite3_open_v2(":memory:", &opened, SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX, nullptr);
    Connection owned(opened);
    result = result == SQLITE_OK ? copyDatabase(source, opened) : result;
    if (result == SQLITE_OK) {
        memory = std::move(owned);
    }
    return result;
}

}  // namespace kz7
