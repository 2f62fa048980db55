#include "install/admin/explanations.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <optional>

#include "install/platform/text.h"

namespace kz7 {
namespace {

// clang-format off
constexpr std::string_view kRest       = "Nothing that was written before is taken back; on the embedded store the run is still one transaction up to its end.";
constexpr std::string_view kGoesOn     = "The run goes on; everything else is as usual.";
constexpr std::string_view kNoCopy     = "Keys of the copy may be half written; no service was created.";
constexpr std::string_view kRunAgain   = "Correct the cause and run the same command again; it overwrites what is there.";
constexpr std::string_view kCheckCopy  = "Run kz7admin check; after the cause is corrected, run the same command again.";
constexpr std::string_view kAsAdmin    = "Run it as an administrator, and see whether the service manager runs.";
constexpr std::string_view kService    = "The copy's keys are written; the service is not as it should be.";
constexpr std::string_view kRepairSvc  = "Correct the cause, then kz7admin repair services NAME.";
constexpr std::string_view kDotnet     = "Correct the cause, then run -dotnet LOCATION again.";
constexpr std::string_view kProviders  = "All keys and aliases are as without this error; only the providers are not registered.";
constexpr std::string_view kStore      = "See the line on standard error that names the store's file, and docs/troubleshooting.md.";
constexpr std::string_view kBug        = "Report it with the whole output: a program has asked for something that it must not ask for.";
constexpr std::string_view kRuntime    = "See the error line or the log kz7msi.log around it.";
constexpr std::string_view kMessage    = "None: it is the number of a message, not of an error.";

constexpr std::array kLines = {
    LineExplanation{392,  "-addKZ7Copy -addv9 -v8 -v9", "write one value of the layout",              "The key or value named in the line cannot be written; rc is the status.", kRest, kRunAgain},
    LineExplanation{421,  "-v9",                  "back the version-8 registry up",             "The product's key cannot be read, or the backup's key cannot be written.", "The old registry is unchanged; the backup is incomplete.", "Correct the cause, then run -v9 again: it takes the backup again."},
    LineExplanation{595,  "-v9 -dotnet -addv9",   "ask the location for its level",             "The level library of the location has no entry sqleGetLevelInfo.", "The level is empty: no level aliases, and empty -level arguments.", "Install the right kz7install64.dll, then run the command again."},
    LineExplanation{601,  "-v9 -dotnet -addv9",   "ask the location for its level",             "bin\\kz7install64.dll of the location does not exist or cannot be loaded. -addv9 always prints it: it takes the copy's name for the location.", "The level is empty: no level aliases, and empty -level arguments.", "Check the location; after -addv9 run -dotnet with the real location."},
    LineExplanation{607,  "-v9 -dotnet -addv9",   "ask the location for its level",             "The level library could not be used; 595 or 601 says why, else it returned no level.", "The level is empty: no level aliases, and empty -level arguments.", "See 595 and 601."},
    LineExplanation{793,  "-v9",                  "name the copy by its level",                 "A value below InstalledCopies cannot be written in the native view.", kGoesOn, kDotnet},
    LineExplanation{809,  "-v9",                  "name the copy by its level",                 "A value below InstalledCopies cannot be written in the 32-bit view.", kGoesOn, kDotnet},
    LineExplanation{941,  "-addKZ7Copy -addv9 -v9", "add the copy",                             "A value (see 392) or the service (see 1739, 1775, 1800 to 1838) could not be made; rc is the status.", "The rows before the failure are written, those after it are not.", kCheckCopy},
    LineExplanation{1241, "-v8",                  "write the version-8 defaults",               "One of the ten values cannot be written; 392 names it.", "The backup may be restored already; the defaults after the failure are missing.", kRunAgain},
    LineExplanation{1345, "-v9",                  "back the version-8 registry up",             "See 421, which is printed before it.", "The old registry is unchanged; nothing is migrated; only -dotnet was run.", "See 421."},
    LineExplanation{1360, "-v9",                  "carry the global profile over",              "GLOBAL_PROFILE of the backup does not exist or cannot be copied.", "The copy has no variables of version 8.", "Set the variables that are needed with kz7admin commit; the backup still has the old ones."},
    LineExplanation{1372, "-v9",                  "add the copy kz7build",                      "See 941, which is printed before it.", "The backup is complete, the old keys are gone, the copy kz7build is incomplete.", "Correct the cause; kz7admin repair migration --back returns to version 8, --on LOCATION goes on."},
    LineExplanation{1388, "-v9",                  "carry the instances over",                   "PROFILES of the backup does not exist or cannot be copied.", "The copy exists without its instances.", "Create the instances with kz7icrt, as the line says."},
    LineExplanation{1406, "-v9",                  "carry the administration server over",       "DAS_PROFILES of the backup does not exist or cannot be copied.", "The copy exists without its administration server.", "Run dascrt, as the line says."},
    LineExplanation{1466, "-v8",                  "restore the backup of a migration",          "No backup exists, which is normal on a machine that was never migrated, or it cannot be copied.", "The backup stays; the defaults are written over what is there.", "None if no backup is expected; else look at it: kz7admin tree SOFTWARE\\NVQ\\KZ7BackupV8."},
    LineExplanation{1467, "-v8",                  "restore the backup of a migration",          "See 1466, which is printed before it.", "See 1466.", "See 1466."},
    LineExplanation{1486, "-v8",                  "write the version-8 defaults",               "See 1241, which is printed before it.", "See 1241.", "See 1241."},
    LineExplanation{1510, "-v8 -v9",              "switch a service off, or start it",          "The service manager cannot be opened.", kService, kAsAdmin},
    LineExplanation{1523, "-v8 -v9",              "switch a service off, or start it",          "The service cannot be opened; 1060 for KZ7MGMTSVC at -v8 is normal: version 8 was never installed.", kService, "None for 1060 at -v8; else run it as an administrator."},
    LineExplanation{1541, "-v8 -v9",              "set the start type of a service",            "The service manager refuses the change.", kService, kAsAdmin},
    LineExplanation{1552, "-v9",                  "start the service",                          "The service does not start: its program is missing, or ends at once.", "The service exists and starts with the machine.", "See the event log, and whether bin\\kz7mgmtsvc.exe exists."},
    LineExplanation{1566, "-v8",                  "stop the service of version 8",              "None: the service was stopped. The tool reports a stop that succeeds as error 1.", "The service is stopped and starts on demand.", "None."},
    LineExplanation{1602, "-dotnet -v9 -addv9",   "remove older data providers",                "The assembly cache refuses it, or the framework is not installed.", kProviders, kDotnet},
    LineExplanation{1629, "-dotnet -v9 -addv9",   "register the 32-bit data provider",          "kz7nmpgac32.exe cannot be started; rc is the status.", kProviders, kDotnet},
    LineExplanation{1636, "-dotnet -v9 -addv9",   "register the data providers",                "A provider file is missing, or the framework that it needs is not installed.", kProviders, "Install the framework, then run -dotnet LOCATION again."},
    LineExplanation{1668, "-dotnet -v9 -addv9",   "run kz7nmpcfg.exe",                          "The program cannot be started: it is missing, or the location is not absolute; rc is the status.", kProviders, kDotnet},
    LineExplanation{1677, "-dotnet -v9 -addv9",   "run kz7nmpcfg.exe",                          "The program ended with the exit code rc.", kProviders, "Run the printed command by hand to see what it says, then -dotnet again."},
    LineExplanation{1689, "-dotnet -v9 -addv9",   "run kz7nmpcfg_32.exe",                       "The program cannot be started: it is missing, or the location is not absolute; rc is the status.", kProviders, kDotnet},
    LineExplanation{1697, "-dotnet -v9 -addv9",   "run kz7nmpcfg_32.exe",                       "The program ended with the exit code rc.", kProviders, "Run the printed command by hand to see what it says, then -dotnet again."},
    LineExplanation{1739, "-addKZ7Copy -addv9 -v9", "create the service",                       "The service manager cannot be opened.", kNoCopy, kAsAdmin},
    LineExplanation{1775, "-addKZ7Copy -addv9 -v9", "create the service",                       "The service manager refuses it: 123 a name that no service can have, 1072 an old service of that name is still open, 1078 its display name is in use.", kNoCopy, kRepairSvc},
    LineExplanation{1800, "-addKZ7Copy -addv9 -v9", "register the event source",                "The key of the event source cannot be created.", "The copy and its service exist; its events have no texts.", kRunAgain},
    LineExplanation{1816, "-addKZ7Copy -addv9 -v9", "register the event source",                "EventMessageFile cannot be written.", "The copy and its service exist; its events have no texts.", kRunAgain},
    LineExplanation{1838, "-addKZ7Copy -addv9 -v9", "register the event source",                "TypesSupported cannot be written.", "The copy and its service exist; its events have no texts.", kRunAgain},
};

constexpr std::array kStatuses = {
    StatusExplanation{kSuccess,                "done",                        true,  "The command did its work; error lines before it may still report a step that failed.", "None; kz7admin check tells whether all is in order."},
    StatusExplanation{kFileNotFound,           "not found",                   true,  "A key, value or program file does not exist.", "The line before it names what is missing."},
    StatusExplanation{kPathNotFound,           "path not found",              false, "A directory of a path is missing.", "Create the directory or correct the path."},
    StatusExplanation{kTooManyOpenFiles,       "too many open files",         false, "The limit on open files is reached.", "Raise the limit, or end what leaks files."},
    StatusExplanation{kAccessDenied,           "access denied",               true,  "The user may not do this, or a key still has subkeys.", "Run it as an administrator or as the owner of the store."},
    StatusExplanation{kInvalidHandle,          "invalid handle",              false, "A handle is not open.", kBug},
    StatusExplanation{kInvalidData,            "invalid data",                false, "A file holds something else than it should.", kRuntime},
    StatusExplanation{kOutOfMemory,            "out of memory",               true,  "No memory was left. Nothing that was not committed is on disk.", "Free memory and run the command again."},
    StatusExplanation{kWriteFault,             "write fault",                 false, "A stream does not take what is written.", "See where the output is redirected to."},
    StatusExplanation{kReadFault,              "read fault",                  false, "The list of copies could not be read whole, so nothing is removed.", "kz7admin check shows what cannot be read."},
    StatusExplanation{kGeneralFailure,         "general failure",             false, "A device or resource failed in a way that has no number.", kRuntime},
    StatusExplanation{kEndOfFile,              "end of file",                 false, "Nothing is left to read.", "Give the input that is asked for."},
    StatusExplanation{kFileExists,             "file exists",                 false, "The file to write exists.", "Choose another name, or --force."},
    StatusExplanation{kInvalidParameter,       "invalid parameter",           true,  "The command line is wrong, with the usage; without it, a name that the registry or the service manager does not accept.", "Compare the command with the usage and with kz7InstallReg(1)."},
    StatusExplanation{kBrokenPipe,             "broken pipe",                 false, "Every writer of a pipe that is read has ended.", kRuntime},
    StatusExplanation{kDiskFull,               "disk full",                   true,  "The disk is full. On the embedded store nothing of the run is on disk.", "Free space and run the command again."},
    StatusExplanation{kCallNotImplemented,     "not implemented",             false, "This host has no such operation.", kBug},
    StatusExplanation{kInvalidName,            "invalid name",                true,  "The name of the copy cannot be part of a service's name: it has a separator or is too long.", "Choose another name. kz7admin check shows what the attempt left behind."},
    StatusExplanation{kModuleNotFound,         "library not found",           false, "A library does not exist or cannot be loaded.", "Check the location; see 601."},
    StatusExplanation{kProcedureNotFound,      "no such entry point",         false, "A library does not have the function.", "Install the right library; see 595."},
    StatusExplanation{kBadPathname,            "bad path",                    false, "The path is empty or names no regular file.", "Correct the path."},
    StatusExplanation{kTooManyThreads,         "too many threads",            false, "The host starts no further thread.", "Raise the limit on threads."},
    StatusExplanation{kBusy,                   "busy",                        true,  "Another program held the store for 5 seconds. Nothing is changed.", "Wait for the other program and run the command again."},
    StatusExplanation{kFilenameExceedsRange,   "path too long",               true,  "A key path has more than 1,023 characters, or a path does not fit its buffer.", "Choose a shorter name or location."},
    StatusExplanation{kPipeClosing,            "pipe closed",                 false, "The reader of a pipe has ended.", "None if the reader needs no more."},
    StatusExplanation{kMoreData,               "more data",                   false, "A buffer is too small for a name or value.", "Look for an unusually long name or value with kz7admin tree."},
    StatusExplanation{kWaitTimedOut,           "timeout",                     false, "What was waited for has not ended.", "See what the program or service is waiting for."},
    StatusExplanation{kNoMoreItems,            "no more items",               false, "An enumeration is at its end.", kBug},
    StatusExplanation{kBadDirectory,           "not a directory",             false, "A program's working directory is not a directory.", "Correct the location of the copy."},
    StatusExplanation{kOperationAborted,       "aborted",                     false, "Another thread ended the operation.", kRuntime},
    StatusExplanation{kBadKey,                 "bad key",                     false, "The path of a key is empty.", kBug},
    StatusExplanation{kCannotOpen,             "cannot open the store",       true,  "The store cannot be opened or created. Nothing is changed.", kStore},
    StatusExplanation{kRegistryCorrupt,        "store damaged",               true,  "The store is damaged. Nothing is changed.", kStore},
    StatusExplanation{kRegistryIoFailed,       "store I/O error",             true,  "The store cannot be read or written. What was not committed is not on disk.", kStore},
    StatusExplanation{kNotRegistryFile,        "not a store",                 true,  "registry.db is not a store. Nothing is changed.", kStore},
    StatusExplanation{kKeyDeleted,             "key deleted",                 false, "The key was deleted while it was open.", "Another program has changed the registry: run the command again."},
    StatusExplanation{kServiceAlreadyRunning,  "service runs already",        false, "The service runs already.", "None."},
    StatusExplanation{kServiceDoesNotExist,    "no such service",             false, "No service has that name; at -v8 normal for KZ7MGMTSVC.", "kz7admin check shows copies without a service."},
    StatusExplanation{kServiceTakesNoControl,  "service is busy",             false, "The service is starting or stopping.", "Wait, then run the command again."},
    StatusExplanation{kServiceNotActive,       "service does not run",        false, "The service does not run.", "None for a stop."},
    StatusExplanation{kServiceMarkedForDelete, "service is being deleted",    false, "The service is deleted, but it still runs or a program has it open.", "Close the service manager's windows, or restart, then run the command again."},
    StatusExplanation{kServiceExists,          "service exists",              false, "A service of that name exists; the tool leaves it as it is.", "None, or kz7admin repair services NAME if it belongs to another location."},
    StatusExplanation{kDuplicateServiceName,   "display name in use",         false, "Another service has the display name.", "Rename the other service, then run the command again."},
    StatusExplanation{kRevisionMismatch,       "newer store",                 true,  "A newer version of the program wrote the store. Nothing is changed.", "Use that version."},
    StatusExplanation{kUnknownFeature,         "unknown feature",             false, "The installation has no feature of that name.", kRuntime},
    StatusExplanation{kBadQuery,               "bad query",                   false, "The installation's database has no such table.", kRuntime},
    StatusExplanation{kActionNotCalled,        "no such action",              false, "The installation has no action of that name.", kRuntime},
    StatusExplanation{kFunctionFailed,         "function failed",             false, "The installer allows the operation at another time only.", kRuntime},
    StatusExplanation{kNoMemory,               "runtime: out of memory",      false, "The installer runtime had no memory for an object of its own.", "Free memory and run the installation again."},
    StatusExplanation{kNullArgument,           "runtime: null argument",      false, "A caller passed no argument.", kBug},
    StatusExplanation{kNoProgramType,          "runtime: no program",         false, "A command names no file of a known program type.", "Correct the command."},
    StatusExplanation{kBufferTooSmall,         "runtime: buffer too small",   false, "A caller's buffer is too small for a text.", kBug},
    StatusExplanation{kNoInstallerSession,     "runtime: no session",         false, "No installer session is open, or no message has that number.", kRuntime},
    StatusExplanation{kMissingItem,            "no such copy",                true,  "-removeKZ7Copy: no copy has that name. Nothing is changed.", "kz7admin copies lists the names. A copy that it lists without a location is not found: add it again, then remove it."},
    StatusExplanation{kNotExecuted,            "runtime: not executed",       false, "A run was waited for before it was executed, or its pipes could not be made.", kRuntime},
    StatusExplanation{kNoSystemFile,           "runtime: no system file",     false, "The instance has no profile folder or no system file.", "Create the instance first."},
    StatusExplanation{kParameterNotSet,        "runtime: parameter not set",  false, "The command processor did not set the parameter, or its value is not allowed.", kRuntime},
    StatusExplanation{kParameterSet,           "runtime: parameter set",      false, "The parameter was set.", kMessage},
    StatusExplanation{kGlobalVariableFailed,   "runtime: variable not set",   false, "A variable for all instances could not be set.", kRuntime},
    StatusExplanation{kNotForInstance,         "runtime: not for instances",  false, "The variable is for all instances only.", "Set it without --instance."},
    StatusExplanation{kUnknownVariable,        "runtime: unknown variable",   false, "No variable or parameter has that name.", "Correct the name in the response file."},
    StatusExplanation{kExitCodeUnavailable,    "runtime: not started",        false, "The program could not be started, or its exit code is not known.", "See whether the program exists and may be started."},
    StatusExplanation{kInstanceVariableFailed, "runtime: variable not set",   false, "A variable of an instance could not be set.", kRuntime},
    StatusExplanation{kThreadStartFailed,      "runtime: no thread",          false, "A thread that reads a program's output could not be started.", "Raise the limit on threads."},
    StatusExplanation{kNotGlobal,              "runtime: not global",         false, "The variable is for single instances only.", "Set it with --instance NAME."},
    StatusExplanation{kVariableSet,            "runtime: variable set",       false, "The variable was set.", kMessage},
    StatusExplanation{kNoInstallationDatabase, "runtime: no database",        false, "The installation's database cannot be opened.", kRuntime},
    StatusExplanation{kVariableNotThere,       "runtime: no such variable",   false, "The profile registry has no such variable.", "None if it was to be removed."},
    StatusExplanation{kFailed,                 "aliases not rewritten",       true,  "-dotnet, -v9, -addv9: the version aliases could not be rewritten. Usual cause: no copy exists in one of the views.", "kz7admin aliases shows them, kz7admin repair aliases rewrites them."},
};
// clang-format on

template <typename Item>
void addOnce(std::vector<const Item*>& items, const Item& item) {
    if (std::find(items.begin(), items.end(), &item) == items.end()) {
        items.push_back(&item);
    }
}

std::optional<std::uint32_t> numberOf(std::string_view word) {
    const bool isHex = word.starts_with("0x") || word.starts_with("0X");
    const bool isNegative = word.starts_with('-');
    word.remove_prefix(isHex ? 2 : isNegative ? 1 : 0);
    std::uint32_t number = 0;
    const auto [end, error] = std::from_chars(word.data(), word.data() + word.size(), number, isHex ? 16 : 10);
    if (error != std::errc{} || end != word.data() + word.size() || word.empty()) {
        return {};
    }
    return isNegative ? ~number + 1 : number;
}

void addLine(std::uint32_t number, Meanings& meanings) {
    for (const LineExplanation& row : kLines) {
        if (row.line == number) {
            addOnce(meanings.lines, row);
        }
    }
}

void addStatus(std::uint32_t number, Meanings& meanings) {
    for (const StatusExplanation& row : kStatuses) {
        if (row.status == number) {
            addOnce(meanings.statuses, row);
        }
    }
}

// The number that begins the text.
std::string_view leadingNumber(std::string_view text) {
    text.remove_prefix(std::min(text.find_first_not_of(' '), text.size()));
    return text.substr(0, text.find_first_not_of("-0123456789abcdefxABCDEFX"));
}

// Calls `add` with each number of a line that follows the mark, or begins with it.
template <typename Add>
void addAfter(std::string_view line, std::string_view mark, bool isPart, Add add) {
    for (std::size_t at = line.find(mark); at != std::string_view::npos; at = line.find(mark, at + 1)) {
        if (const auto number = numberOf(leadingNumber(line.substr(isPart ? at : at + mark.size())))) {
            add(*number);
        }
    }
}

void addMentioned(std::string_view line, Meanings& meanings) {
    for (const std::string_view source : {"uselvlkz7reg.cpp:", "uselvlkz7reg:"}) {
        addAfter(line, source, false, [&](std::uint32_t number) { addLine(number, meanings); });
    }
    const auto status = [&](std::uint32_t number) { addStatus(number, meanings); };
    for (const std::string_view mark : {"rc =", "rc=", "error code", "error ", "exit code", "status", "value "}) {
        addAfter(line, mark, false, status);
    }
    addAfter(line, "0x", true, status);
}

}  // namespace

std::span<const LineExplanation> lineExplanations() {
    return kLines;
}

std::span<const StatusExplanation> statusExplanations() {
    return kStatuses;
}

bool findMeanings(std::string_view word, Meanings& meanings) {
    const std::optional<std::uint32_t> number = numberOf(word);
    if (!number) {
        return false;
    }
    addLine(*number, meanings);
    addStatus(*number, meanings);
    for (const StatusExplanation& row : kStatuses) {
        const std::uint32_t seen = (row.status & 0xFF) == 0 && row.status != kSuccess ? 1 : row.status & 0xFF;
        if (row.isExitCode && row.status > 255 && seen == *number) {
            addOnce(meanings.seenInShell, row);
        }
    }
    return true;
}

Meanings findMentioned(std::string_view text) {
    Meanings meanings;
    for (std::size_t begin = 0; begin < text.size();) {
        const std::size_t end = std::min(text.find('\n', begin), text.size());
        addMentioned(text.substr(begin, end - begin), meanings);
        begin = end + 1;
    }
    return meanings;
}

}  // namespace kz7
