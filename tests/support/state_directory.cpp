#include "tests/support/state_directory.h"

#include <sqlite3.h>

#include <filesystem>

#include "install/platform/embedded/history.h"
#include "install/platform/embedded/registry.h"
#include "tests/support/registry_dump.h"

namespace kz7::test {

ProgramResult StateDirectory::run(const std::string& program, Arguments arguments, ProgramOptions options) const {
    arguments.insert(arguments.begin(), programPath(program));
    options.environment.push_back("KZ7_STATE_DIR=" + path());
    return runProgram(arguments, options);
}

pid_t StateDirectory::start(Arguments arguments) const {
    arguments.insert(arguments.begin(), programPath(programOf(arguments)));
    return startProgram(arguments, {{"KZ7_STATE_DIR=" + path()}, {}});
}

std::string StateDirectory::dumpOf(const std::string& folder) {
    std::string faults;
    EmbeddedRegistry registry(folder, true,
                              [&](const StoreFault& fault) { faults += "fault: " + fault.reason + "\n"; });
    std::string text = dumpRegistry(registry);
    return faults + text;
}

std::string StateDirectory::wholeOf(const std::string& folder) {
    std::string text = dumpOf(folder);
    EmbeddedRegistry registry(folder, true, [](const StoreFault&) {});
    std::vector<HistoryRun> runs;
    EmbeddedHistory(registry).list(runs);
    for (const HistoryRun& run : runs) {
        text += "run " + std::to_string(run.number) + ": " + std::to_string(run.counts.values) + " values\n";
    }
    return text;
}

std::string StateDirectory::integrity() const {
    std::string found;
    const auto note = [](void* text, int, char** row, char**) {
        *static_cast<std::string*>(text) += row[0];
        return 0;
    };
    sqlite3* database = nullptr;
    if (sqlite3_open_v2(file("registry.db").c_str(), &database, SQLITE_OPEN_READWRITE, nullptr) != SQLITE_OK ||
        sqlite3_exec(database, "PRAGMA integrity_check", note, &found, nullptr) != SQLITE_OK) {
        found = sqlite3_errmsg(database);
    }
    sqlite3_close(database);
    return found;
}

void StateDirectory::copyFrom(const StateDirectory& other) const {
    std::filesystem::copy(other.path(), path(),
                          std::filesystem::copy_options::recursive | std::filesystem::copy_options::overwrite_existing);
}

}  // namespace kz7::test
