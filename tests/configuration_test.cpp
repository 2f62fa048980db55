// The configuration handler: variables of the profile registry, and parameters through the command processor.
#include <gtest/gtest.h>

#include <sstream>
#include <utility>
#include <vector>

#include "install/runtime/config_handler.h"
#include "tests/support/registry_dump.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

const std::string kProcessor = "C:\\copy1\\bin\\kz7cmd.exe";

ConfigurationTarget targetOf(std::string_view instance) {
    ConfigurationTarget target;
    target.instance.assign(instance);
    target.profile.assign(instance);
    return target;
}

void addCopyKey(IRegistryStore& registry) {
    OwnedKey key(registry);
    registry.createKey(KeyHandle::localMachine, "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\COPY1", {}, 0, key.receive());
}

class Configuration : public testing::Test {
protected:
    Configuration() {
        machine.openLog();
        machine.engine.installationPath = "C:\\copy1";
        machine.files_.add("C:\\prof\\INST\\kz7systm");
        machine.processes_.addProgram(kProcessor, {.output = "done"});
        machine.processes_.started.clear();
        addCopyKey(machine.registry_);
        profile.set("INST", "KZ7INSTPROF", "C:\\prof");
        profile.set("OTHER", "KZ7INSTPROF", "C:\\prof");
        profile.set(kGlobalProfile, "KZ7INSTPROF", "C:\\prof");
    }

    using Lines = std::vector<std::pair<const char*, std::string>>;

    // Commits variables and parameters; returns the log and the result.
    std::string commit(const char* instance, const Lines& lines) {
        KZ7CfgHandler handler(machine.engine, profile, targetOf(instance));
        handler.setFollowUp([this] { ++followed; });
        for (const auto& [name, value] : lines) {
            if (handler.recordVariable(name, value) != kSuccess) {
                EXPECT_EQ(handler.recordParameter(name, value), kSuccess) << name;
            }
        }
        Status status = kSuccess;
        const std::string log = machine.logged([&] {
            status = handler.commitProfileReg();
            EXPECT_EQ(handler.commitDBMCfg(instance), kSuccess);
        });
        return log + compose("%u: %u set, %u not set", {status, handler.successes(), handler.failures()});
    }

    // The values of the copy's profiles, by the ends of their paths.
    std::string profiles() {
        std::istringstream dump(dumpRegistry(machine.registry_));
        std::string values;
        for (std::string line; std::getline(dump, line);) {
            if (line.front() != '[') {
                values += line.substr(line.find("COPY1\\") + 6) + "\n";
            }
        }
        return values;
    }

    RuntimeMachine machine;
    ProfileRegistry profile{machine.registry_, "COPY1"};
    int followed = 0;  // runs of the command processor
};

TEST_F(Configuration, VariablesAreSetWhereTheyAreAllowed) {
    // Names compare without case and get the table's spelling, the later of two lines counts, and removing a variable
    // that is not set succeeds.
    EXPECT_EQ(commit("INST", {{"KZ7ACCOUNT", "an earlier line"},
                              {"KZ7LDAPHOST", "ldap"},
                              {"KZ7COMM", ""},
                              {"kz7codepage", "1208"},
                              {"KZ7ACCOUNT", "a \"b\" 50%"}}),
              "Note: Registry variable set: KZ7ACCOUNT=a \"b\" 50% INST\n"
              "Note: Registry variable set: KZ7CODEPAGE=1208 INST\n"
              "Note: Registry variable set: KZ7COMM= INST\n"
              "ERROR: A registry variable may not be set for an instance: KZ7LDAPHOST=ldap, instance INST\n"
              "5061: 3 set, 1 not set");
    EXPECT_EQ(commit("", {{"KZ7LDAPHOST", "ldap"}, {"KZ7LDAP_BASEDN", "dn"}}),
              "Note: Registry variable set: KZ7LDAPHOST=ldap \nNote: Registry variable set: KZ7LDAP_BASEDN=dn \n"
              "0: 2 set, 0 not set");
    EXPECT_EQ(commit("", {{"KZ7LDAPHOST", ""}}), "Note: Registry variable set: KZ7LDAPHOST= \n0: 1 set, 0 not set");
    EXPECT_EQ(profiles(),
              "GLOBAL_PROFILE : KZ7INSTPROF = 1:C:\\prof\\x00\n"
              "GLOBAL_PROFILE : KZ7LDAP_BASEDN = 1:dn\\x00\n"
              "PROFILES\\INST : KZ7INSTPROF = 1:C:\\prof\\x00\n"
              "PROFILES\\INST : KZ7ACCOUNT = 1:a \"b\" 50%\\x00\n"
              "PROFILES\\INST : KZ7CODEPAGE = 1:1208\\x00\n"
              "PROFILES\\OTHER : KZ7INSTPROF = 1:C:\\prof\\x00\n");
    KZ7CfgHandler handler(machine.engine, profile, {});
    std::string value;
    EXPECT_EQ(handler.recordVariable("NOPE", "1"), kUnknownVariable);
    EXPECT_EQ(handler.recordParameter("NOPE", "1"), kMissingItem);
    EXPECT_EQ(handler.getVariable("NOPE", value), kUnknownVariable);
    EXPECT_EQ(handler.getVariable("KZ7PATH", value), kVariableNotThere);
}

TEST_F(Configuration, ParametersAreSetByTheCommandProcessor) {
    const std::string command = "\"" + kProcessor + "\" /c kz7 update dbm config using ";
    const std::string set = "Note: Database-manager parameter set: ";
    const std::string fails = "ERROR: Could not set a database-manager parameter: DIAGLEVEL=";
    const std::string refuses = "Note: setDBMUsingProcess, step 10: error 5057: DIAGLEVEL\n" + fails;
    const std::string long780(780, 'v');
    // Blanks and percent signs are unchanged; of two names of one parameter the command has the first.
    EXPECT_EQ(commit("INST", {{"DIAGLEVEL", "3"}, {"DFTDBPATH", "a b%PATH%%d"}, {"MAXDARI", "7"}}),
              set + "DFTDBPATH=a b%PATH%%d, instance INST\n" + set + "DIAGLEVEL=3, instance INST\n" + set +
                  "MAXDARI=7, instance INST\n0: 3 set, 0 not set");
    machine.processes_.addProgram(kProcessor, {.output = "out of range", .exitCode = 7});
    EXPECT_EQ(commit("INST", {{"DIAGLEVEL", "9"}}),
              "Note: setDBMUsingProcess, step 30: error 5030: exit code 7\nNote: Output of setDBMUsingProcess: out of "
              "range\n" +
                  fails + "9, instance INST, error 5057\n0: 0 set, 1 not set");
    EXPECT_EQ(machine.processes_.started,
              (std::vector<std::string>{command + "DFTDBPATH \"a b%PATH%%d\"", command + "DIAGLEVEL \"3\"",
                                        command + "FENCED_POOL \"7\"", command + "DIAGLEVEL \"9\""}));
    const std::string noFile = "Note: KZ7CfgHandler::set_dbm_parameter, step 20: error 5056: OTHER\n" + fails;
    // clang-format off
    const struct { const char* why; const char* instance; std::string value; std::string log; std::string error; } refused[] = {
        {"an instance without its system file",      "OTHER", "3",         noFile,  "5056"},
        {"an instance without a profile folder",     "NONE",  "3",         fails,   "5056"},
        {"a quotation mark would end the value",     "INST",  "3\" & x",   refuses, "5057"},
        {"a backslash would quote the closing mark", "INST",  "C:\\d\\",   refuses, "5057"},
        {"a line end would end the command",         "INST",  "3\n4",      refuses, "5057"},
        {"cut, the command would set another value", "INST",  long780,     refuses, "5057"},
    };
    // clang-format on
    for (const auto& row : refused) {
        EXPECT_EQ(commit(row.instance, {{"DIAGLEVEL", row.value}}),
                  row.log + row.value + ", instance " + row.instance + ", error " + row.error + "\n0: 0 set, 1 not set")
            << row.why;
    }
    EXPECT_EQ(machine.processes_.started.size(), 4U);
    EXPECT_EQ(followed, 4);
}

TEST_F(Configuration, OneParameterAtOnce) {
    const std::string doubled = "C:\\copy1\\\\bin\\kz7cmd.exe";
    KZ7CfgHandler handler(machine.engine, profile, targetOf("INST"));
    machine.processes_.addProgram(doubled, {.exitCode = 7});
    EXPECT_EQ(handler.set_dbm_parameter("INST", 64, "3"), kSuccess) << "a run that fails is traced only";
    EXPECT_EQ(handler.set_dbm_parameter("INST", 4711, "3"), kNoSystemFile) << "no such parameter";
    EXPECT_EQ(handler.set_dbm_parameter(nullptr, 64, "3"), kNoSystemFile) << "no instance, no system file";
    machine.engine.installationPath.clear();
    EXPECT_EQ(handler.set_dbm_parameter("INST", 64, "3"), kSuccess);
    EXPECT_EQ(handler.recordParameter("DIAGLEVEL", "3"), kSuccess);
    EXPECT_EQ(handler.commitDBMCfg("INST"), kSuccess) << "a copy without a location has nothing to commit to";
    EXPECT_TRUE(machine.logText().ends_with(
        "Note: setDBMUsingProcess, step 30: error 5030: exit code 7\n"
        "Note: KZ7CfgHandler::set_dbm_parameter, step 20: error 5056: The instance has no profile folder or no system "
        "configuration file.\n"
        "Note: KZ7CfgHandler::set_dbm_parameter, step 10: error 5056: The instance has no profile folder or no system "
        "configuration file.\n"));
    EXPECT_EQ(machine.processes_.started,
              std::vector<std::string>{"\"" + doubled + "\" /c kz7 update dbm config using DIAGLEVEL \"3\""});
}

}  // namespace
}  // namespace kz7::test
