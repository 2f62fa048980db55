// The configuration handler: variables of the profile registry, and parameters through the command processor.
#include <gtest/gtest.h>

#include "install/platform/faulty/file_system.h"
#include "install/platform/faulty/process_host.h"
#include "install/platform/faulty/registry.h"
#include "install/platform/faulty/threads.h"
#include "install/runtime/config_handler.h"
#include "tests/support/registry_dump.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

const std::string kCopy = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\COPY1";
const std::string kProcessor = "C:\\copy1\\bin\\kz7cmd.exe";

ConfigurationTarget targetOf(std::string_view instance) {
    ConfigurationTarget target;
    target.instance.assign(instance);
    target.profile.assign(instance);
    return target;
}

class Configuration : public testing::Test {
protected:
    Configuration() {
        machine.openLog();
        machine.engine.installationPath = "C:\\copy1";
        machine.files_.add("C:\\prof\\INST\\kz7systm");
        machine.processes_.addProgram(kProcessor, {.output = "done"});
        machine.processes_.started.clear();
        logged();
    }

    // What was logged since the last look.
    std::string logged() {
        const std::string text = machine.logText();
        const std::string added = text.substr(seen_);
        seen_ = text.size();
        return added;
    }

    RuntimeMachine machine;
    ProfileRegistry profile{machine.registry_, "COPY1"};

private:
    std::size_t seen_ = 0;
};

TEST_F(Configuration, VariablesAreSetWhereTheyMayBe) {
    // clang-format off
    const struct {
        const char* why; const char* instance; const char* name; const char* value; Status status; const char* log; const char* key; const char* stored;
    } rows[] = {
        {"for an instance", "INST", "KZ7ACCOUNT", "a \"b\" 50%", 0,
         "Note: Registry variable set: KZ7ACCOUNT=a \"b\" 50% INST\n", "PROFILES\\INST", "KZ7ACCOUNT = 1:a \"b\" 50%\\x00\n"},
        {"names compare without case and keep the table's spelling", "INST", "kz7codepage", "1208", 0,
         "Note: Registry variable set: KZ7CODEPAGE=1208 INST\n", "PROFILES\\INST", "KZ7CODEPAGE = 1:1208\\x00\n"},
        {"for all of the copy", "", "KZ7LDAPHOST", "ldap", 0,
         "Note: Registry variable set: KZ7LDAPHOST=ldap \n", "GLOBAL_PROFILE", "KZ7LDAPHOST = 1:ldap\\x00\n"},
        {"not for an instance", "INST", "KZ7LDAPHOST", "ldap", 5061,
         "ERROR: A registry variable may not be set for an instance: KZ7LDAPHOST=ldap, instance INST\n", "", ""},
        {"removed", "", "KZ7LDAPHOST", "", 0, "Note: Registry variable set: KZ7LDAPHOST= \n", "GLOBAL_PROFILE", ""},
        {"removing what is not set is success", "INST", "KZ7COMM", "", 0,
         "Note: Registry variable set: KZ7COMM= INST\n", "PROFILES\\INST", ""},
    };
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        logged();
        KZ7CfgHandler handler(machine.engine, profile, targetOf(row.instance));
        ASSERT_EQ(handler.recordVariable(row.name, "an earlier line"), kSuccess);
        ASSERT_EQ(handler.recordVariable(row.name, row.value), kSuccess);
        EXPECT_EQ(handler.commitProfileReg(), row.status);
        EXPECT_EQ(logged(), row.log);
        EXPECT_EQ(handler.failures(), row.status == 0 ? 0U : 1U);
        if (*row.key != '\0') {
            const std::string dump = dumpRegistry(machine.registry_, KeyHandle::localMachine, kCopy + "\\" + row.key);
            EXPECT_NE(dump.find(row.stored), std::string::npos) << dump;
            EXPECT_EQ(dump.find(std::string(row.name) + " = ") != std::string::npos,
                      row.stored[0] != '\0' && std::string(row.name) != "kz7codepage");
        }
    }
    KZ7CfgHandler handler(machine.engine, profile, {});
    std::string value;
    EXPECT_EQ(handler.recordVariable("NOPE", "1"), kUnknownVariable);
    EXPECT_EQ(handler.recordParameter("NOPE", "1"), kMissingItem);
    EXPECT_EQ(handler.getVariable("NOPE", value), kUnknownVariable);
    EXPECT_EQ(handler.getVariable("KZ7PATH", value), kVariableNotThere);
}

TEST_F(Configuration, ParametersAreSetByTheCommandProcessor) {
    profile.set("INST", "KZ7INSTPROF", "C:\\prof");
    profile.set("OTHER", "KZ7INSTPROF", "C:\\prof");
    const std::string command = "\"" + kProcessor + "\" /c kz7 update dbm config using ";
    const std::string set = "Note: Database-manager parameter set: ";
    const std::string fails = "ERROR: Could not set a database-manager parameter: ";
    const std::string long780(780, 'v');
    // clang-format off
    const struct {
        const char* why; const char* instance; const char* name; std::string value; ScriptedProgram program; std::string started; std::string log;
    } rows[] = {
        {"set", "INST", "DIAGLEVEL", "3", {}, command + "DIAGLEVEL \"3\"", set + "DIAGLEVEL=3, instance INST\n"},
        {"blanks and percent signs stay as they are", "INST", "DFTDBPATH", "a b%PATH%%d", {},
         command + "DFTDBPATH \"a b%PATH%%d\"", set + "DFTDBPATH=a b%PATH%%d, instance INST\n"},
        {"of two names of one parameter the processor is told the first", "INST", "MAXDARI", "7", {},
         command + "FENCED_POOL \"7\"", set + "MAXDARI=7, instance INST\n"},
        {"the processor fails and says why", "INST", "DIAGLEVEL", "9", {.output = "out of range", .exitCode = 7},
         command + "DIAGLEVEL \"9\"",
         "Note: setDBMUsingProcess, step 30: error 5030: exit code 7\n"
         "Note: The program wrote: out of range\n" + fails + "DIAGLEVEL=9, instance INST, error 5057\n"},
        {"an instance without its system file", "OTHER", "DIAGLEVEL", "3", {}, "",
         "Note: KZ7CfgHandler::set_dbm_parameter, step 20: error 5056: OTHER\n" + fails + "DIAGLEVEL=3, instance OTHER, error 5056\n"},
        {"an instance without a profile folder", "NONE", "DIAGLEVEL", "3", {}, "", fails + "DIAGLEVEL=3, instance NONE, error 5056\n"},
        {"a quotation mark would end the value", "INST", "DIAGLEVEL", "3\" & x", {}, "",
         "Note: setDBMUsingProcess, step 10: error 5057: DIAGLEVEL\n" + fails + "DIAGLEVEL=3\" & x, instance INST, error 5057\n"},
        {"a backslash would quote the closing mark", "INST", "DIAGPATH", "C:\\d\\", {}, "",
         "Note: setDBMUsingProcess, step 10: error 5057: DIAGPATH\n" + fails + "DIAGPATH=C:\\d\\, instance INST, error 5057\n"},
        {"a line end would end the command", "INST", "DIAGLEVEL", "3\n4", {}, "",
         "Note: setDBMUsingProcess, step 10: error 5057: DIAGLEVEL\n" + fails + "DIAGLEVEL=3\n4, instance INST, error 5057\n"},
        {"cut, the command would set another value", "INST", "DIAGLEVEL", long780, {}, "",
         "Note: setDBMUsingProcess, step 10: error 5057: DIAGLEVEL\n" + fails + "DIAGLEVEL=" + long780 + ", instance INST, error 5057\n"},
    };
    // clang-format on
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        logged();
        machine.processes_.started.clear();
        machine.processes_.addProgram(kProcessor, row.program);
        KZ7CfgHandler handler(machine.engine, profile, targetOf(row.instance));
        int followed = 0;
        handler.setFollowUp([&] { ++followed; });
        ASSERT_EQ(handler.recordParameter(row.name, row.value), kSuccess);
        EXPECT_EQ(handler.commitDBMCfg(row.instance), kSuccess);
        const std::vector<std::string> started =
            row.started.empty() ? std::vector<std::string>{} : std::vector<std::string>{row.started};
        EXPECT_EQ(machine.processes_.started, started);
        EXPECT_EQ(followed, row.started.empty() ? 0 : 1);
        EXPECT_EQ(logged(), row.log);
    }
    EXPECT_EQ(machine.processes_.openHandles(), 0U);
}

TEST_F(Configuration, OneParameterAtOnce) {
    profile.set("INST", "KZ7INSTPROF", "C:\\prof");
    profile.set(kGlobalProfile, "KZ7INSTPROF", "C:\\prof");
    const std::string doubled = "C:\\copy1\\\\bin\\kz7cmd.exe";
    KZ7CfgHandler handler(machine.engine, profile, targetOf("INST"));
    machine.processes_.addProgram(doubled, {.exitCode = 7});
    EXPECT_EQ(handler.set_dbm_parameter("INST", 64, "3"), kSuccess) << "a run that fails is traced only";
    EXPECT_EQ(machine.processes_.started,
              std::vector<std::string>{"\"" + doubled + "\" /c kz7 update dbm config using DIAGLEVEL \"3\""});
    EXPECT_EQ(logged(), "Note: setDBMUsingProcess, step 30: error 5030: exit code 7\n");
    EXPECT_EQ(handler.set_dbm_parameter("INST", 4711, "3"), kNoSystemFile) << "no such parameter";
    EXPECT_EQ(handler.set_dbm_parameter(nullptr, 64, "3"), kNoSystemFile) << "no instance, no system file";
    machine.engine.installationPath.clear();
    EXPECT_EQ(handler.set_dbm_parameter("INST", 64, "3"), kSuccess);
    EXPECT_NE(logged().find("KZ7CfgHandler::set_dbm_parameter, step 10: error 5056: "), std::string::npos);
    ASSERT_EQ(handler.recordParameter("DIAGLEVEL", "3"), kSuccess);
    EXPECT_EQ(handler.commitDBMCfg("INST"), kSuccess);
    EXPECT_EQ(logged(), "") << "a copy without a place has nothing to commit to";
}

// Every call fails once: what it hit is reported as not set, the others are set, nothing stays open.
TEST_F(Configuration, NoFailureStopsTheOthers) {
    std::uint64_t calls = 0;
    for (std::uint64_t call = 1; call <= calls + 1; ++call) {
        RuntimeMachine host;
        host.files_.add("C:\\prof\\INST\\kz7systm");
        host.processes_.addProgram(kProcessor, {});
        ProfileRegistry plain(host.registry_, "COPY1");
        plain.set("INST", "KZ7INSTPROF", "C:\\prof");
        FaultCounter faults(call, false, kGeneralFailure);
        FaultyRegistry registry(host.registry_, faults);
        FaultyFileSystem files(host.files_, faults);
        FaultyProcessHost processes(host.processes_, faults);
        FaultyThreads threads(host.threads_, faults);
        URE engine(
            {files, processes, threads, host.console_, host.lines_, host.terminal_, host.clock_, host.identity_});
        engine.installationPath = "C:\\copy1";
        ProfileRegistry faulty(registry, "COPY1");
        KZ7CfgHandler handler(engine, faulty, targetOf("INST"));
        for (const char* name : {"KZ7ACCOUNT", "KZ7COMM"}) {
            handler.recordVariable(name, "1");
        }
        for (const char* name : {"DIAGLEVEL", "NUMDB"}) {
            handler.recordParameter(name, "1");
        }
        handler.commitProfileReg();
        handler.commitDBMCfg("INST");
        const std::string row = faults.failed() + " is call " + std::to_string(call);
        EXPECT_EQ(handler.successes() + handler.failures(), 4U) << row;
        EXPECT_LE(handler.failures(), faults.failed().empty() ? 0U : 1U) << row;
        EXPECT_EQ(host.registry_.openHandles(), 0U) << row;
        EXPECT_EQ(host.processes_.openHandles(), 0U) << row;
        if (!faults.failed().empty()) {
            calls = call;
        }
    }
    EXPECT_GT(calls, 30U);
}

}  // namespace
}  // namespace kz7::test
