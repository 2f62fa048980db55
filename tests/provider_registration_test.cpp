// "-dotnet" and "-addv9": exact lines, commands and registries on a machine in memory.
#include <gtest/gtest.h>

#include <cstring>

#include "install/platform/text.h"
#include "install/src/services/provider_registration.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

const std::string kCopies = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies";
const std::string kRecords = "SOFTWARE\\Classes\\Installer\\Assemblies\\Global";

struct LevelRecord {
    char level[256];
};
std::string levelText;
int levelResult = 0;

int sampleLevel(std::uint32_t version, LevelRecord* record) {
    EXPECT_EQ(version, 0x09010000U);
    std::memcpy(record->level, levelText.data(), std::min(levelText.size(), sizeof record->level));
    return levelResult;
}

// A location with all files of a copy, whose programs succeed, and one copy for the aliases.
void installAt(Machine& machine, const std::string& location) {
    levelText = "KZ7 v9.7.800.123";
    levelResult = 0;
    const std::string folder = location + "\\bin\\";
    machine.libraries_.libraries[folder + "kz7install64.dll"]["sqleGetLevelInfo"] =
        reinterpret_cast<LibraryFunction>(&sampleLevel);
    machine.files_.add(folder + "kz7nmpdata.dll");
    machine.files_.add(folder + "kz7nmpgac32.exe");
    for (const char* program : {"kz7nmpgac32.exe", "kz7nmpcfg.exe", "kz7nmpcfg_32.exe"}) {
        machine.processes_.addProgram(folder + program, {.output = "not to be seen", .error = "nor this"});
    }
    machine.make("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies");
    for (const auto& [name, data] : {std::pair{"Version", "9"}, {"Release", "7"}, {"Modification", "800"}}) {
        machine.set(kCopies + "\\COPY1\\CurrentVersion", name, data);
    }
}

constexpr const char* kAliases = "9.7.800.0=COPY1 9.7.800=COPY1 9.7=COPY1 9=COPY1";

// The lines that announce both configuration programs.
std::string configured(const std::string& level, const std::string& location, const std::string& end = {}) {
    const std::string arguments = " -register -level " + level + " -kz7path " + location + end;
    const std::string program = (end.empty() ? location + "\\" : location) + "bin\\kz7nmpcfg";
    return program + ".exe" + arguments + program + "_32.exe" + arguments + " -migratev8 ";
}

TEST(DotNet, RegistersALocationInBothForms) {
    for (const std::string location : {"C:\\KZ7", "C:\\KZ7\\"}) {
        const std::string end = location.ends_with('\\') ? "\n" : "";
        Machine machine;
        installAt(machine, "C:\\KZ7");
        installAt(machine, location);  // the library is searched after a doubled separator
        machine.set(kRecords, "kz7nmpold.dll,level=\"9.7.8\",generation=\"1\"", "old");
        machine.set(kRecords, "kz7nmpold.dll,level=\"9.7.80\",generation=\"1\"", "another level's");

        EXPECT_EQ(machine.result({"-DOTNET", location}),
                  "Level Returned: 9.7.8.1\n" + configured("9.7.8", location, end) + "||0");

        const std::string arguments = compose(" -register -level 9.7.8 -kz7path %s%s", {location, end});
        const std::vector<std::string> started = {"\"C:\\KZ7\\bin\\kz7nmpgac32.exe\" -i \"" + location + "\" ",
                                                  "\"C:\\KZ7\\bin\\kz7nmpcfg.exe\"" + arguments,
                                                  "\"C:\\KZ7\\bin\\kz7nmpcfg_32.exe\"" + arguments + " -migratev8 "};
        EXPECT_EQ(machine.processes_.started, started);
        EXPECT_EQ(machine.console_.flushed, machine.console_.output.size()) << "before the last program started";
        EXPECT_EQ(machine.registry_.commits(), 4U) << "before each program and at the end";
        EXPECT_EQ(machine.values(kCopies), kAliases);
        EXPECT_EQ(machine.values(kRecords),
                  "kz7nmpdata.dll,level=\"9.7.8\",generation=\"1\"=C:\\KZ7\\bin\\kz7nmpdata.dll! "
                  "kz7nmpdata.dll,level=\"9.7.8\",generation=\"2\"=C:\\KZ7\\bin\\kz7nmpdata.dll! "
                  "kz7nmpold.dll,level=\"9.7.80\",generation=\"1\"=another level's!");
    }
}

TEST(DotNet, UsesLocationsUnchanged) {
    Machine machine;
    machine.processes_.otherPrograms = ScriptedProgram{};
    machine.run({"-dotnet", "C:\\100%s\\a.exe b"});
    EXPECT_EQ(machine.console_.output, "Level Returned: \n" + configured("", "C:\\100%s\\a.exe b"));
    const std::string arguments = ".exe -register -level  -kz7path C:\\100%s\\a.exe b";
    const std::vector<std::string> started = {"\"C:\\100%s\\a.exe\" b\\bin\\kz7nmpcfg" + arguments,
                                              "\"C:\\100%s\\a.exe\" b\\bin\\kz7nmpcfg_32" + arguments + " -migratev8 "};
    EXPECT_EQ(machine.processes_.started, started) << "the program's name ends at the first \".exe\"";

    machine.run({"-dotnet", "C:\\" + std::string(1500, 'x')});
    const std::string cut = "C:\\" + std::string(997, 'x');
    EXPECT_EQ(machine.console_.output, "Level Returned: \n" + cut + cut) << "1,000 characters, whatever is appended";
    EXPECT_EQ(machine.processes_.started, started) << "what does not fit 779 of them is not run";
    EXPECT_EQ(machine.console_.error, kPrefix + "601: Unable to load C:\\" + std::string(257, 'x') + "\n" + kPrefix +
                                          "607: Unable to retrieve the version of the sqllib\n" + kPrefix +
                                          "1668: Failed to execute kz7nmpcfg.exe command.  rc = 5082\n" + kPrefix +
                                          "1689: Failed to execute kz7nmpcfg_32.exe command.  rc = 5082\n");
}

TEST(LevelQuery, ShortensAndJoinsTheComponents) {
    // clang-format off
    const struct { const char* why; std::string text; std::string level; } rows[] = {
        {"the third and the fourth lose two characters where they have three", "KZ7 v100.100.800.123", "100.100.8.1"},
        {"fewer components have no dot at the end",   "KZ7 v9.7",                        "9.7"},
        {"none",                                      "KZ7 v",                           ""},
        {"empty ones are kept",                       "KZ7 v9..0.1",                     "9..0.1"},
        {"but not at the end",                        "KZ7 v9.1.0.",                     "9.1.0"},
        {"a fifth goes the way of the fourth",        "KZ7 v9.1.0.0.500",                "9.1.0.0.5"},
        {"the record need not be terminated",         "KZ7 v9." + std::string(300, '1'), "9." + std::string(249, '1')},
        {"no level leaves the text as it was",        "9.1.0.0",                         "as passed in"},
        {"another product",                           "KZ8 v9.1.0.0",                    "as passed in"},
    };
    // clang-format on
    for (const auto& row : rows) {
        Machine machine;
        installAt(machine, "C:\\KZ7");
        levelText = row.text;
        Report report(machine.console_);
        std::string level = "as passed in";
        queryLevel(machine.libraries_, report, "C:\\KZ7", level);
        EXPECT_EQ(level, row.level) << row.why;
        EXPECT_EQ(machine.console_.output, "Level Returned: " + row.level + "\n") << row.why;
        levelResult = -1;
        queryLevel(machine.libraries_, report, "C:\\KZ7", level = "before");
        EXPECT_EQ(level, "before") << "a call that fails";
    }
}

TEST(AddV9, RegistersTheProvidersOfALocationNamedAsTheCopy) {
    Machine machine;
    installAt(machine, "COPY1");
    EXPECT_EQ(machine.run({"-addV9", "COPY1", "C:\\KZ7"}), kSuccess);
    EXPECT_TRUE(
        machine.console_.output.ends_with("COPY1 install copy at C:\\KZ7 added successfully\n"
                                          "Level Returned: 9.7.8.1\n" +
                                          configured("9.7.8", "COPY1")));
    EXPECT_EQ(machine.values(kCopies), kAliases);

    // The result of the add is ignored: this name cannot have a service.
    EXPECT_EQ(machine.run({"-addv9", "a\\b", "C:\\KZ7"}), kSuccess);
    EXPECT_NE(machine.console_.error.find("941: Unable to add a new copy"), std::string::npos);
}

TEST(Migration, EndsWithTheProvidersAndReadsTheLevelFromTheLibrary) {
    Machine machine;
    installAt(machine, "C:\\KZ7");
    EXPECT_EQ(machine.run({"-v9", "C:\\KZ7"}), kSuccess);
    EXPECT_NE(machine.console_.output.find("Full Version registry key set to 9.7.8.1\n"), std::string::npos);
    EXPECT_TRUE(machine.console_.output.ends_with(configured("9.7.8", "C:\\KZ7")));
    // "8.1.11" looks like an alias of a copy that is gone.
    EXPECT_EQ(machine.values(kCopies),
              "9.7.8.DEF.2=kz7build! 9.7.800.0=kz7build 9.7.800=kz7build 9.7=kz7build 9=kz7build =kz7build! "
              "defaultClientInterfaceCopy=kz7build!");
}

}  // namespace
}  // namespace kz7::test
