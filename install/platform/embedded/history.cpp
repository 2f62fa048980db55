#include "install/platform/embedded/history.h"

#include <fcntl.h>
#include <pwd.h>
#include <sys/utsname.h>
#include <unistd.h>

#include <array>
#include <charconv>
#include <cstdlib>
#include <ctime>
#include <functional>
#include <utility>

namespace kz7 {
namespace {

constexpr const char* kRunVariable = "KZ7_RUN";  // for the programs that a run starts: its number
constexpr std::int64_t kMostRuns = 1000;
constexpr std::int64_t kRemovedAtOnce = 25;  // runs; the removal of each on its own would slow every run down
constexpr std::int64_t kMostBytes = std::int64_t{256} << 20;

// A statement that is used once.
class Once {
public:
    Once(sqlite3* connection, const char* sql) : Once(connection, sql, nullptr) {}

    Query& query() { return query_; }

private:
    Once(sqlite3* connection, const char* sql, sqlite3_stmt* statement)
        : error_(sqlite3_prepare_v2(connection, sql, -1, &statement, nullptr)),
          statement_(statement),
          query_(statement, error_) {}

    int error_;
    Statement statement_;
    Query query_;
};

// Only the number is written: looking the name up takes longer than the whole run.
std::string userName(std::string_view number) {
    uid_t id = 0;
    const auto [end, error] = std::from_chars(number.data(), number.data() + number.size(), id);
    const passwd* const user = error == std::errc{} && end == number.data() + number.size() ? getpwuid(id) : nullptr;
    return user == nullptr ? std::string(number) : user->pw_name;
}

std::string hostName() {
    utsname found{};
    return uname(&found) == 0 ? found.nodename : "";
}

bool hasTables(sqlite3* connection) {
    const auto has = [connection](const char* table) {
        return sqlite3_table_column_metadata(connection, "main", table, nullptr, nullptr, nullptr, nullptr, nullptr,
                                             nullptr) == SQLITE_OK;
    };
    return has("run") && has("runpart");
}

struct flock byteOf(std::uint64_t number) {
    struct flock lock {};
    lock.l_type = F_WRLCK;
    lock.l_whence = SEEK_SET;
    lock.l_start = static_cast<off_t>(number);
    lock.l_len = 1;
    return lock;
}

HistoryRun runOf(const Query& row) {
    HistoryRun run;
    run.number = static_cast<std::uint64_t>(row.number(0));
    run.parent = static_cast<std::uint64_t>(row.number(1));
    run.undoes = static_cast<std::uint64_t>(row.number(2));
    run.begun = row.number(3);
    run.ended = row.number(4);
    run.status = static_cast<Status>(row.number(5));
    run.user = userName(row.bytes(6));
    run.host = row.bytes(7);
    run.program = row.bytes(8);
    run.arguments = splitTexts(row.bytes(9));
    run.outside = splitTexts(row.bytes(10));
    run.counts = {static_cast<std::size_t>(row.number(11)), static_cast<std::size_t>(row.number(12)),
                  static_cast<std::size_t>(row.number(13))};
    run.state = row.number(14) == 0 ? RunState::ended : RunState::interrupted;
    return run;
}

using IsRunning = std::function<bool(std::uint64_t)>;

// Both tables, up to the run before `number`. A run in progress stays, with all that are newer: it will add to its
// entry.
int removeBefore(sqlite3* connection, std::int64_t number, const IsRunning& isRunning) {
    Once unended(connection, "SELECT number FROM run WHERE number < ? AND status IS NULL ORDER BY number");
    unended.query().bind(number);
    bool isCapped = false;
    while (!isCapped && unended.query().step() == SQLITE_ROW) {
        isCapped = isRunning(static_cast<std::uint64_t>(unended.query().number(0)));
        number = isCapped ? unended.query().number(0) : number;
    }
    Once runs(connection, "DELETE FROM run WHERE number < ?");
    const int result = runs.query().bind(number).step();
    if (result != SQLITE_DONE || sqlite3_changes(connection) == 0) {
        return result == SQLITE_DONE ? SQLITE_OK : result;
    }
    return execute(connection,
                   "DELETE FROM runpart WHERE id < coalesce((SELECT firstpart FROM run ORDER BY number LIMIT 1),"
                   " (SELECT max(id) + 1 FROM runpart))");
}

// What the table of parts holds.
struct Parts {
    std::int64_t last = 0;   // its number
    std::int64_t total = 0;  // bytes of all that were ever written
};

int readParts(sqlite3* connection, Parts& parts) {
    Once last(connection, "SELECT id, total FROM runpart ORDER BY id DESC LIMIT 1");
    const int result = last.query().step();
    if (result == SQLITE_ROW) {
        parts = {last.query().number(0), last.query().number(1)};
    }
    return result == SQLITE_ROW || result == SQLITE_DONE ? SQLITE_OK : result;
}

// Leaves the newest runs, as many as fit.
int removeOldest(sqlite3* connection, std::int64_t newest, const Parts& parts, const IsRunning& isRunning) {
    // Numbers ascend from 1.
    const bool isFull = newest > kMostRuns && newest % kRemovedAtOnce == 0;
    const int result = isFull ? removeBefore(connection, newest - kMostRuns + 1, isRunning) : SQLITE_OK;
    if (result != SQLITE_OK || parts.total <= kMostBytes) {
        return result;
    }
    Once first(connection, "SELECT run FROM runpart WHERE total - length(changes) >= ? ORDER BY id LIMIT 1");
    return first.query().bind(parts.total - kMostBytes).step() == SQLITE_ROW
               ? removeBefore(connection, first.query().number(0), isRunning)
               : SQLITE_OK;
}

}  // namespace

void EmbeddedHistory::begin(const HistoryStart& run) {
    start_ = run;
    begun_ = std::time(nullptr);
}

Status EmbeddedHistory::append(std::string part) {
    part_ = std::move(part);
    return kSuccess;
}

Status EmbeddedHistory::settle(const ChangeCounts& counts) {
    counts_ = counts;
    if (part_.empty() || (number_ == 0 && counts.isEmpty())) {
        part_.clear();
        return kSuccess;
    }
    const Status status = registry_.use([&](sqlite3* connection) { return write(connection, counts); });
    part_.clear();
    return status;
}

// A part over the limit would push out everything else, and itself.
int EmbeddedHistory::write(sqlite3* connection, const ChangeCounts& counts) {
    if (part_.size() > static_cast<std::size_t>(kMostBytes)) {
        return SQLITE_OK;
    }
    int result = hasTables(connection) ? SQLITE_OK : execute(connection, kHistoryTables);
    Parts parts;
    result = result == SQLITE_OK ? readParts(connection, parts) : result;
    bool isThere = number_ != 0;
    result = result == SQLITE_OK && isThere ? updateRun(connection, counts, isThere) : result;
    ++parts.last;
    parts.total += static_cast<std::int64_t>(part_.size());
    result = result == SQLITE_OK && !isThere ? addRun(connection, counts, parts.last) : result;
    if (result == SQLITE_OK) {
        Once add(connection, "INSERT INTO runpart (id, run, total, changes) VALUES (?, ?, ?, ?)");
        const auto number = static_cast<std::int64_t>(number_);
        result = add.query().bind(parts.last).bind(number).bind(parts.total).bindBytes(part_).step();
        result = result == SQLITE_DONE
                     ? removeOldest(connection, number, parts, [this](std::uint64_t run) { return isLocked(run); })
                     : result;
    }
    // Tables of that name that are not ours: the run is more important than its entry.
    return result == SQLITE_ERROR ? SQLITE_OK : result;
}

// A run that starts no programs has one commit point, which ends it.
std::int64_t EmbeddedHistory::ended() const {
    return start_.startsPrograms ? 0 : std::time(nullptr);
}

int EmbeddedHistory::addRun(sqlite3* connection, const ChangeCounts& counts, std::int64_t part) {
    Once add(connection,
             "INSERT INTO run (ended, status, nvalues, nkeys, nservices, outside, parent, undoes, begun, user, host,"
             " program, arguments, firstpart) VALUES (?1, iif(?1, 0, NULL), ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?, ?)");
    const std::string outside = joinTexts(outside_);
    const std::string user = std::to_string(geteuid());
    const std::string host = hostName();
    const std::string arguments = joinTexts(start_.arguments);
    const int result = add.query()
                           .bind(ended())
                           .bind(static_cast<std::int64_t>(counts.values))
                           .bind(static_cast<std::int64_t>(counts.keys))
                           .bind(static_cast<std::int64_t>(counts.services))
                           .bind(std::string_view(outside))
                           .bind(static_cast<std::int64_t>(parentOf(connection)))
                           .bind(static_cast<std::int64_t>(start_.undoes))
                           .bind(begun_)
                           .bind(std::string_view(user))
                           .bind(std::string_view(host))
                           .bind(std::string_view(start_.program))
                           .bind(std::string_view(arguments))
                           .bind(part)
                           .step();
    if (result != SQLITE_DONE) {
        return result;
    }
    number_ = static_cast<std::uint64_t>(sqlite3_last_insert_rowid(connection));
    if (start_.startsPrograms) {
        setenv(kRunVariable, std::to_string(number_).c_str(), 1);
        locks_.receive() =
            open((registry_.path() + "-runs").c_str(), O_RDWR | O_CREAT | O_NONBLOCK | O_NOFOLLOW | O_CLOEXEC, 0600);
        struct flock lock = byteOf(number_);
        fcntl(locks_.get(), F_OFD_SETLK, &lock);
    }
    return SQLITE_OK;
}

int EmbeddedHistory::updateRun(sqlite3* connection, const ChangeCounts& counts, bool& isThere) {
    Once update(connection,
                "UPDATE run SET ended = ?1, status = iif(?1, 0, NULL), nvalues = ?, nkeys = ?, nservices = ?,"
                " outside = ? WHERE number = ?");
    const std::string outside = joinTexts(outside_);
    const int result = update.query()
                           .bind(ended())
                           .bind(static_cast<std::int64_t>(counts.values))
                           .bind(static_cast<std::int64_t>(counts.keys))
                           .bind(static_cast<std::int64_t>(counts.services))
                           .bind(std::string_view(outside))
                           .bind(static_cast<std::int64_t>(number_))
                           .step();
    // Not there: the transaction that wrote it was taken back.
    isThere = sqlite3_changes(connection) != 0;
    return result == SQLITE_DONE ? SQLITE_OK : result;
}

std::uint64_t EmbeddedHistory::parentOf(sqlite3* connection) {
    const char* const given = std::getenv(kRunVariable);
    const std::string text = given == nullptr ? "" : given;
    std::uint64_t number = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
    if (text.empty() || error != std::errc{} || end != text.data() + text.size()) {
        return 0;
    }
    Once find(connection, "SELECT 1 FROM run WHERE number = ? AND status IS NULL");
    const bool isThere = find.query().bind(static_cast<std::int64_t>(number)).step() == SQLITE_ROW;
    return isThere && isLocked(number) ? number : 0;
}

bool EmbeddedHistory::isLocked(std::uint64_t number) {
    const OwnedDescriptor file(
        open((registry_.path() + "-runs").c_str(), O_RDONLY | O_NONBLOCK | O_NOFOLLOW | O_CLOEXEC));
    struct flock lock = byteOf(number);
    lock.l_type = F_WRLCK;
    return file && fcntl(file.get(), F_OFD_GETLK, &lock) == 0 && lock.l_type != F_UNLCK;
}

// Without an error: what the run was to do is done, and an entry that cannot be ended is seen as interrupted.
void EmbeddedHistory::end(Status status) {
    const bool isEnded = !start_.startsPrograms && status == kSuccess;
    if (number_ != 0 && (!isEnded || counts_.isEmpty())) {
        registry_.useQuietly([&](sqlite3* connection) {
            // All of it may have been taken back by a later part.
            Once remove(connection, "DELETE FROM run WHERE number = ?");
            Once update(connection, "UPDATE run SET status = ?, ended = unixepoch(), outside = ? WHERE number = ?");
            const std::string outside = joinTexts(outside_);
            const auto number = static_cast<std::int64_t>(number_);
            return counts_.isEmpty() ? remove.query().bind(number).step()
                                     : update.query()
                                           .bind(static_cast<std::int64_t>(status))
                                           .bind(std::string_view(outside))
                                           .bind(number)
                                           .step();
        });
    }
    number_ = 0;
    locks_.reset();
}

Status EmbeddedHistory::list(std::vector<HistoryRun>& runs) {
    std::vector<HistoryRun> found;
    const Status status = registry_.use([&](sqlite3* connection) {
        if (!hasTables(connection)) {
            return SQLITE_OK;
        }
        Once all(
            connection,
            "SELECT number, parent, undoes, begun, ended, status, user, host, program, arguments, outside, nvalues,"
            " nkeys, nservices, status IS NULL FROM run ORDER BY number");
        int result = 0;
        while ((result = all.query().step()) == SQLITE_ROW) {
            found.push_back(runOf(all.query()));
        }
        return result == SQLITE_DONE ? SQLITE_OK : result;
    });
    for (HistoryRun& run : found) {
        if (run.state == RunState::interrupted && isLocked(run.number)) {
            run.state = RunState::running;
        }
    }
    if (status == kSuccess) {
        runs = std::move(found);
    }
    return status;
}

Status EmbeddedHistory::read(std::uint64_t number, HistoryChanges& changes) {
    HistoryChanges found;
    const Status status = registry_.use([&](sqlite3* connection) {
        Once parts(connection,
                   "SELECT changes FROM runpart WHERE id >= (SELECT firstpart FROM run WHERE number = ?1) AND run = ?1"
                   " ORDER BY id");
        int result = 0;
        parts.query().bind(static_cast<std::int64_t>(number));
        while ((result = parts.query().step()) == SQLITE_ROW) {
            found.parts.emplace_back(parts.query().bytes(0));
        }
        return result == SQLITE_DONE ? SQLITE_OK : result;
    });
    if (status == kSuccess) {
        changes = std::move(found);
    }
    return status;
}

Status EmbeddedHistory::trim(std::uint64_t number) {
    return registry_.use([&](sqlite3* connection) {
        return hasTables(connection) ? removeBefore(connection, static_cast<std::int64_t>(number),
                                                    [this](std::uint64_t run) { return isLocked(run); })
                                     : SQLITE_OK;
    });
}

}  // namespace kz7
