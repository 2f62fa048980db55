// The migrations between the version-8 layout and the copies, in both directions: exact lines and registries.
#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <sstream>

#include "install/src/version8.h"
#include "install/src/version9.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

const std::string kDefaultLines =
    "Creating registry key KZ7 Path Name under SOFTWARE\\NVQ\\KZ7 with value C:\\KZ8\n"
    "Creating registry key BASE_CLIENT under SOFTWARE\\NVQ\\KZ7\\Components with value \n"
    "Creating registry key Modification under SOFTWARE\\NVQ\\KZ7\\CurrentVersion with value 3\n"
    "Creating registry key Release under SOFTWARE\\NVQ\\KZ7\\CurrentVersion with value 2\n"
    "Creating registry key Version under SOFTWARE\\NVQ\\KZ7\\CurrentVersion with value 8\n"
    "Creating registry key Service Level under SOFTWARE\\NVQ\\KZ7\\CurrentVersion with value BUILD\n"
    "Creating registry key  under SOFTWARE\\NVQ\\KZ7\\PROFILES with value \n"
    "Creating registry key KZ7PATH under SOFTWARE\\NVQ\\KZ7\\GLOBAL_PROFILE with value C:\\KZ8\n"
    "Creating registry key  under SOFTWARE\\NVQ\\KZ7\\DAS_PROFILES with value \n"
    "Creating registry key  under SOFTWARE\\NVQ\\KZ7\\InstalledCopies with value KZ7V8\n";

TEST(Version8, RestoresTheBackupAndWritesTheDefaults) {
    Machine machine;
    machine.set("SOFTWARE\\NVQ\\KZ7", "KZ7 Path Name", "C:\\now");
    machine.set("SOFTWARE\\NVQ\\KZ7", "stays", "now");
    machine.set("SOFTWARE\\NVQ\\KZ7", "top", "now");
    machine.set("SOFTWARE\\NVQ\\KZ7BackupV8", "top", "backup");
    machine.set("SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES\\I", "", "instance");
    machine.addService("KZ7MGMTSVC", false);
    machine.servicesLeftOpen = 2;  // by the switch-off

    EXPECT_EQ(machine.result({"-V8", "C:\\KZ8"}), "Creating version 8 registry\n" + kDefaultLines +
                                                      "Version 8 default registry keys created successfully\n||0")
        << "a stop that fails says nothing";
    EXPECT_EQ(machine.dump("SOFTWARE\\NVQ"),
              "[SOFTWARE\\NVQ\\KZ7] \nSOFTWARE\\NVQ\\KZ7 : KZ7 Path Name = 1:C:\\KZ8\\x00\n"
              "SOFTWARE\\NVQ\\KZ7 : stays = 1:now\\x00\nSOFTWARE\\NVQ\\KZ7 : top = 1:backup\\x00\n"
              "[SOFTWARE\\NVQ\\KZ7\\CurrentVersion] \n"
              "SOFTWARE\\NVQ\\KZ7\\CurrentVersion : Modification = 1:3\\x00\n"
              "SOFTWARE\\NVQ\\KZ7\\CurrentVersion : Release = 1:2\\x00\n"
              "SOFTWARE\\NVQ\\KZ7\\CurrentVersion : Version = 1:8\\x00\n"
              "SOFTWARE\\NVQ\\KZ7\\CurrentVersion : Service Level = 1:BUILD\\x00\n"
              "[SOFTWARE\\NVQ\\KZ7\\DAS_PROFILES] \nSOFTWARE\\NVQ\\KZ7\\DAS_PROFILES :  = 1:\\x00\n"
              "[SOFTWARE\\NVQ\\KZ7\\GLOBAL_PROFILE] \nSOFTWARE\\NVQ\\KZ7\\GLOBAL_PROFILE : KZ7PATH = 1:C:\\KZ8\\x00\n"
              "[SOFTWARE\\NVQ\\KZ7\\InstalledCopies] \nSOFTWARE\\NVQ\\KZ7\\InstalledCopies :  = 1:KZ7V8\\x00\n"
              "[SOFTWARE\\NVQ\\KZ7\\PROFILES] \nSOFTWARE\\NVQ\\KZ7\\PROFILES :  = 1:\\x00\n"
              "[SOFTWARE\\NVQ\\KZ7\\PROFILES\\I] \nSOFTWARE\\NVQ\\KZ7\\PROFILES\\I :  = 1:instance\\x00\n")
        << "the components that were just written are gone, and so is the backup";
    EXPECT_NE(machine.service("KZ7MGMTSVC").find("Start = 4:\\x03"), std::string::npos) << "on demand";
    EXPECT_EQ(machine.services_.openHandles(), 2U);
}

TEST(Version8, WritesTheDefaultsAfterOtherFailures) {
    Machine machine;
    machine.set("SOFTWARE\\NVQ\\KZ7BackupV8", "too large", std::string(10001, 'x'));
    machine.addService("KZ7MGMTSVC", true);
    machine.servicesLeftOpen = 3;
    EXPECT_EQ(machine.run({"-v8", "C:\\KZ8"}), kSuccess);
    EXPECT_TRUE(machine.console_.error.ends_with(kPrefix + "1566: Unable to stop the service KZ7MGMTSVC - error 1\n"))
        << "a stop that succeeds";
    EXPECT_FALSE(machine.runs("KZ7MGMTSVC"));
    EXPECT_TRUE(machine.has("SOFTWARE\\NVQ\\KZ7BackupV8")) << "a backup that cannot be restored stays";
}

class Version9 : public testing::Test {
protected:
    Status migrate(const std::string& level = "9.1.0.0") {
        machine.console_.both.clear();
        return migrateToVersion9(
            machine.registry_, machine.services_, report, [&](std::string_view) { return level; },
            [&](std::string_view location) {
                registeredFor = location;
                return Status{77};
            },
            "C:\\KZ9");
    }
    // The lines of the console, except those that announce a value.
    std::string reported() {
        std::string text;
        std::istringstream lines(machine.console_.both);
        for (std::string line; std::getline(lines, line);) {
            if (!line.starts_with("Creating registry key")) {
                text += line + "\n";
            }
        }
        return text;
    }

    Machine machine;
    Report report{machine.console_};
    std::string registeredFor;
};

const std::string kLevelLines =
    "Creating full version 9 registry\n"
    "Full Version registry key set to 9.1.0.0\n"
    "Full Version registry key set to 9.1.0.0 in the 32-bit registry hive. \n"
    "Full Version registry key set to 9.1.0\n"
    "Full Version registry key set to 9.1.0 in the 32-bit registry hive. \n"
    "Full Version registry key set to 9.1\n"
    "Full Version registry key set to 9.1 in the 32-bit registry hive. \n"
    "Full Version registry key set to 9\n"
    "Full Version registry key set to 9 in the 32-bit registry hive. \n"
    "kz7build install copy at C:\\KZ9 added successfully\n";

TEST_F(Version9, MigratesAVersion8Registry) {
    const std::string product = "SOFTWARE\\NVQ\\KZ7";
    machine.set(product, "KZ7 Path Name", "C:\\KZ8");
    machine.set(product + "\\Components", "BASE_CLIENT", "");
    machine.set(product + "\\GLOBAL_PROFILE", "KZ7PATH", "C:\\KZ8");
    machine.set(product + "\\GLOBAL_PROFILE", "KZ7SYSTEM", "host");
    machine.set(product + "\\PROFILES", "", "default of the profiles");
    machine.set(product + "\\PROFILES\\INST1", "KZ7COMM", "TCPIP");
    machine.set(product + "\\DAS_PROFILES\\DAS00", "KZ7COMM", "TCPIP");
    machine.set(product + "\\InstalledCopies\\OLD", "KZ7 Path Name", "C:\\old");
    const std::string before = machine.dump(product);

    EXPECT_EQ(migrate(), 77U);

    EXPECT_EQ(reported(), "Backing up V8 Registry\nGLOBAL_PROFILE successfully copied from prior version\n" +
                              kLevelLines +
                              "Instances successfully copied from prior version\n"
                              "DAS Profiles successfully copied from prior version\n"
                              "Version 9 registry is configured successfully\n");
    EXPECT_EQ(registeredFor, "C:\\KZ9");
    EXPECT_EQ(machine.console_.error, "");
    std::string backup = before;
    for (std::size_t at = 0; (at = backup.find(product, at)) != std::string::npos; at += product.size()) {
        backup.insert(at + product.size(), "BackupV8");
    }
    EXPECT_EQ(machine.dump(product + "BackupV8"), backup);
    EXPECT_FALSE(machine.has(product + "\\PROFILES"));
    EXPECT_TRUE(machine.has(product + "\\InstalledCopies\\OLD"));
    const std::string copy = product + "\\InstalledCopies\\kz7build";
    EXPECT_EQ(machine.values(copy + "\\GLOBAL_PROFILE"), "KZ7PATH=C:\\KZ9! KZ7SYSTEM=host!")
        << "carried over first, so the add sets its own path";
    EXPECT_EQ(machine.dump(copy + "\\PROFILES"), copy + "\\PROFILES :  = 1:\\x00\n[" + copy + "\\PROFILES\\INST1] \n" +
                                                     copy + "\\PROFILES\\INST1 : KZ7COMM = 1:TCPIP\\x00\n")
        << "carried over afterwards, so the add's default stays";
    EXPECT_TRUE(machine.has(copy + "\\DAS_PROFILES\\DAS00"));
    EXPECT_NE(machine.service("KZ7MGMTSVC_kz7build"), "");
    EXPECT_FALSE(machine.runs("KZ7MGMTSVC_kz7build")) << "it exists by then, so the start is not reached";
    EXPECT_EQ(machine.values(product + "\\InstalledCopies"),
              "8.1.11=kz7build! 9.1.0.0=kz7build! 9.1.0.DEF.2=kz7build! 9.1.0=kz7build! 9.1=kz7build! 9=kz7build! "
              "=kz7build! defaultClientInterfaceCopy=kz7build!");
    EXPECT_EQ(machine.registry_.commits(), 0U) << "the provider registration makes the migration visible";
}

TEST_F(Version9, ReportsWhatIsMissingAndDoesTheRest) {
    EXPECT_EQ(migrate(), 77U);
    EXPECT_EQ(reported(), "Backing up V8 Registry\n" + kPrefix +
                              "421: Failed to copy copy SOFTWARE\\NVQ\\KZ7 to SOFTWARE\\NVQ\\KZ7BackupV8\n" + kPrefix +
                              "1345: Error occurred while backing up old registry\n");
    EXPECT_EQ(registeredFor, "C:\\KZ9");
    EXPECT_EQ(machine.dump(), "") << "without a registry only the providers are registered";

    machine.make("SOFTWARE\\NVQ\\KZ7");
    EXPECT_EQ(migrate("9"), 77U);
    EXPECT_EQ(machine.values("SOFTWARE\\NVQ\\KZ7\\InstalledCopies"), "8.1.11=kz7build! 9=kz7build! =kz7build!")
        << "a level without a dot";

    machine.set("SOFTWARE\\NVQ\\KZ7\\Components", "MULTI_VERSION_SUPPORT", "");
    machine.set("SOFTWARE\\NVQ\\KZ7\\PROFILES\\I", "v", "");
    EXPECT_EQ(migrate(), 77U);
    EXPECT_EQ(reported(), "Version 9 Registry exists - no backup needed\n" + kLevelLines +
                              "Version 9 registry is configured successfully\n");
    EXPECT_FALSE(machine.has("SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES"));
    EXPECT_TRUE(machine.has("SOFTWARE\\NVQ\\KZ7\\PROFILES\\I"));
}

// The lines of a dump, except the aliases, which depend on the copies.
std::set<std::string> linesOf(const std::string& dump) {
    std::set<std::string> all;
    std::istringstream lines(dump);
    for (std::string line; std::getline(lines, line);) {
        if (line.find("KZ7\\InstalledCopies :") == std::string::npos) {
            all.insert(line);
        }
    }
    return all;
}

TEST_F(Version9, AMigrationAndTheWayBackLoseNothing) {
    const std::string product = "SOFTWARE\\NVQ\\KZ7";
    std::string deep = product;
    for (int depth = 0; depth < 200; ++depth) {
        deep += "\\d";
    }
    machine.make(deep, "a class");
    machine.set(deep, "at the bottom", "v");
    machine.setRaw(deep, "bytes", std::string_view("\0\xFF\0", 3), ValueType::qword);
    for (const char* path : {"\\InstalledCopies\\InstalledCopies", "\\PROFILES\\InstalledCopies\\x",
                             "\\$CurrentInstallationName$", "\\PROFILES\\$CurrentInstallationName$"}) {
        machine.set(product + path, "", "default");
    }
    // Just below the limit of a path in the backup, whose key is eight characters longer.
    std::string longest = product + "\\Long";
    while (longest.size() + 201 <= 1023 - 8) {
        longest += "\\" + std::string(200, 'l');
    }
    longest += "\\" + std::string(1023 - 8 - longest.size() - 1, 's');
    machine.set(longest, "v", "");
    const auto before = linesOf(machine.dump(product));

    migrate();
    machine.servicesLeftOpen = 2;
    EXPECT_EQ(machine.run({"-v8", "C:\\KZ8"}), kSuccess);
    EXPECT_FALSE(machine.has(product + "BackupV8"));
    const auto after = linesOf(machine.dump(product));
    std::vector<std::string> lost;
    std::set_difference(before.begin(), before.end(), after.begin(), after.end(), std::back_inserter(lost));
    EXPECT_EQ(lost, std::vector<std::string>{}) << "all stayed in the copies key or came out of the backup";

    // With one more character the backup fails and nothing is migrated. A cut path would name the other key.
    machine.set(longest + "s", "v", "over the limit");
    const auto over = linesOf(machine.dump(product));
    EXPECT_EQ(machine.run({"-v9", "C:\\KZ9"}), kSuccess);
    EXPECT_NE(machine.console_.error.find(":421: "), std::string::npos);
    EXPECT_EQ(machine.run({"-v8", "C:\\KZ8"}), kSuccess);
    EXPECT_EQ(linesOf(machine.dump(product)), over);
}

}  // namespace
}  // namespace kz7::test
