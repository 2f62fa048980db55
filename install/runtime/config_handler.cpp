#include "install/runtime/config_handler.h"

#include <algorithm>

#include "install/runtime/guarded.h"
#include "install/runtime/install_process.h"

namespace kz7 {
namespace {

constexpr std::string_view kProfileFolderVariable = "KZ7INSTPROF";
constexpr std::string_view kSystemFile = "kz7systm";
constexpr std::string_view kCommand = "%s\\bin\\kz7cmd.exe /c kz7 update dbm config using %s";

// The row of a name in a table; the size of the table if it has no such name.
template <typename Table>
std::size_t rowOf(const Table& table, std::string_view name) {
    return static_cast<std::size_t>(
        std::find_if(table.begin(), table.end(), [&](const auto& row) { return equalsIgnoreCase(row.name, name); }) -
        table.begin());
}

// `missing`: the table has no such name.
template <typename Table, typename Values>
Status record(const Table& table, Values& values, std::string_view name, std::string_view value, Status missing) {
    return guarded([&] {
        const std::size_t row = rowOf(table, name);
        if (row == table.size()) {
            return missing;
        }
        values[row] = std::string(value);
        return kSuccess;
    });
}

// Whether a value, in quotation marks at the end of a command line, cannot end the quotation.
bool staysQuoted(std::string_view value) {
    return !value.ends_with('\\') && std::none_of(value.begin(), value.end(),
                                                  [](char c) { return c == '"' || (c >= 0 && c < ' ') || c == 0x7F; });
}

std::string withoutBackslash(std::string folder) {
    if (folder.ends_with('\\')) {
        folder.pop_back();
    }
    return folder;
}

}  // namespace

Status KZ7CfgHandler::recordVariable(std::string_view name, std::string_view value) {
    return record(kRegistryVariables, variables_, name, value, kUnknownVariable);
}

Status KZ7CfgHandler::recordParameter(std::string_view name, std::string_view value) {
    return record(kDatabaseManagerParameters, parameters_, name, value, kMissingItem);
}

void KZ7CfgHandler::tellSet(Status message, std::initializer_list<Insert> inserts) {
    ++successes_;
    ure_.traceMessage(message, inserts);
}

void KZ7CfgHandler::tellNotSet(Status message, std::initializer_list<Insert> inserts) {
    ++failures_;
    ure_.message(kCodeError, message, inserts);
}

Status KZ7CfgHandler::commitProfileReg() {
    const std::string_view instance = target_.isInstance() ? target_.instance.view() : "";
    Status last = kSuccess;
    for (std::size_t row = 0; row < kRegistryVariables.size(); ++row) {
        if (!variables_[row]) {
            continue;
        }
        const RegistryVariable& variable = kRegistryVariables[row];
        const std::string& value = *variables_[row];
        const Status status = setVariable(variable, value);
        if (status == kSuccess) {
            read_[row].reset();
            tellSet(kVariableSet, {variable.name, value, instance});
        } else {
            tellNotSet(status, {variable.name, value, instance});
            last = status;
        }
    }
    return last;
}

// Success, or the number of the message with the reason.
Status KZ7CfgHandler::setVariable(const RegistryVariable& variable, const std::string& value) {
    const bool isInstance = target_.isInstance();
    if ((variable.scope & (isInstance ? kInstanceScope : kGlobalScope)) == 0) {
        return isInstance ? kNotForInstance : kNotGlobal;
    }
    const Status status = profile_.set(profileName(), variable.name, value);
    if (status == kSuccess || (status == kVariableNotThere && value.empty())) {
        return kSuccess;
    }
    return isInstance ? kInstanceVariableFailed : kGlobalVariableFailed;
}

Status KZ7CfgHandler::getVariable(std::string_view name, std::string& value) {
    return guarded([&] { return readVariable(name, profileName(), value); });
}

Status KZ7CfgHandler::readVariable(std::string_view name, std::string_view profile, std::string& value) {
    const std::size_t row = rowOf(kRegistryVariables, name);
    if (row == kRegistryVariables.size()) {
        return kUnknownVariable;
    }
    // Deliberate: the first value that was read is returned for every other profile too; a handler serves one instance.
    if (!read_[row]) {
        std::string found;
        const Status status = profile_.get(profile, kRegistryVariables[row].name, found);
        if (status != kSuccess) {
            return status;
        }
        read_[row] = std::move(found);
    }
    value = *read_[row];
    return kSuccess;
}

Status KZ7CfgHandler::set_dbm_parameter(const char* instance, std::uint32_t identifier, std::string_view value) {
    return guarded([&] { return set(instance, identifier, value); });
}

Status KZ7CfgHandler::set(const char* instance, std::uint32_t identifier, std::string_view value) {
    std::string folder = ure_.installationPath;
    if (folder.empty()) {
        ure_.trace(kTraceError, "KZ7CfgHandler::set_dbm_parameter", 10, kNoSystemFile, {});
        return kSuccess;
    }
    // Deliberate: the folder ends in a backslash and the command adds another; command lines are compared with those of
    // older logs.
    folder = withoutBackslash(std::move(folder)) + '\\';
    bool ran = false;
    const Status status = setParameter(instance != nullptr ? instance : "", identifier, value, folder, ran);
    return ran ? kSuccess : status;
}

Status KZ7CfgHandler::commitDBMCfg(std::string_view instance) {
    return guarded([&] { return commitParameters(instance); });
}

Status KZ7CfgHandler::commitParameters(std::string_view instance) {
    if (ure_.installationPath.empty()) {
        return kSuccess;
    }
    const std::string folder = withoutBackslash(ure_.installationPath);
    for (std::size_t row = 0; row < kDatabaseManagerParameters.size(); ++row) {
        if (!parameters_[row]) {
            continue;
        }
        const DatabaseManagerParameter& parameter = kDatabaseManagerParameters[row];
        const std::string& value = *parameters_[row];
        bool ran = false;
        const Status status = guarded([&] { return setParameter(instance, parameter.identifier, value, folder, ran); });
        if (ran && followUp_) {
            followUp_();
        }
        if (status == kSuccess) {
            tellSet(kParameterSet, {parameter.name, value, instance});
        } else {
            tellNotSet(kParameterNotSet, {parameter.name, value, instance, status});
        }
    }
    return kSuccess;
}

// `folder` is the copy's. `ran`: the command processor was called, with or without success.
Status KZ7CfgHandler::setParameter(std::string_view instance, std::uint32_t identifier, std::string_view value,
                                   const std::string& folder, bool& ran) {
    std::string profiles;
    const Status read = readVariable(kProfileFolderVariable, instance.empty() ? kGlobalProfile : instance, profiles);
    // The command processor may write to the store.
    const Status settled = profile_.settle();
    if (read != kSuccess || settled != kSuccess) {
        return kNoSystemFile;
    }
    if (ure_.ports.files.probe(compose("%s\\%s\\%s", {profiles, instance, kSystemFile})) != kSuccess) {
        ure_.trace(kTraceError, "KZ7CfgHandler::set_dbm_parameter", 20, kNoSystemFile, instance);
        return kNoSystemFile;
    }
    // Deliberate: of two names with one identifier the command processor gets the first; it knows both as one
    // parameter.
    const auto* parameter = std::find_if(kDatabaseManagerParameters.begin(), kDatabaseManagerParameters.end(),
                                         [&](const auto& row) { return row.identifier == identifier; });
    if (parameter == kDatabaseManagerParameters.end()) {
        return kNoSystemFile;
    }
    return runProcessor(folder, parameter->name, value, ran);
}

Status KZ7CfgHandler::runProcessor(const std::string& folder, std::string_view parameter, std::string_view value,
                                   bool& ran) {
    constexpr std::string_view kFunction = "setDBMUsingProcess";
    const std::string quoted = compose(" \"%s\"", {value});
    const std::string command = compose(kCommand, {folder, parameter}) + quoted;
    const std::string directory = compose("%s\\bin", {folder});
    InstallProcess process(ure_.ports.processes, ure_.ports.threads, ure_, command.c_str(), directory.c_str());
    if (!staysQuoted(value) || !process.commandLine().ends_with(quoted)) {
        // A truncated command line would set another value.
        ure_.trace(kTraceError, kFunction, 10, kParameterNotSet, parameter);
        return kParameterNotSet;
    }
    ran = true;
    std::uint32_t exitCode = 0;
    Status status = process.execute(true, false);
    if (status == kSuccess) {
        status = process.waitForCompletion(exitCode, kInfiniteWait);
    }
    if (status != kSuccess) {
        ure_.trace(kTraceError, kFunction, 20, status, parameter);
        return kParameterNotSet;
    }
    if (exitCode != 0) {
        ure_.trace(kTraceError, kFunction, 30, kNotExecuted, compose("exit code %u", {exitCode}));
        process.postOutput(kFunction, 1);
        return kParameterNotSet;
    }
    return kSuccess;
}

}  // namespace kz7
