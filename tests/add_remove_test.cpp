// Adding and removing copies, and the command line: exact lines, statuses and registries.
#include <gtest/gtest.h>

#include "tests/support/backends.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

const std::string kCopies = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies";
const std::string kCopies32 = "SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies";
const std::string kEventSource = "SYSTEM\\CurrentControlSet\\Services\\EventLog\\Application\\KZ7 Management Service";

// In a text, '#' is the copy's key and '@' its location.
std::string filled(const std::string& text, const std::string& key, const std::string& location) {
    std::string result;
    for (const char c : text) {
        result += c == '#' ? key : c == '@' ? location : std::string(1, c);
    }
    return result;
}

std::string addLines(const std::string& name, const std::string& location) {
    const std::string lines =
        "Creating registry key KZ7 Path Name under # with value @\n"
        "Creating registry key BASE_CLIENT under #\\Components with value \n"
        "Creating registry key MULTI_VERSION_SUPPORT under #\\Components with value \n"
        "Creating registry key Modification under #\\CurrentVersion with value 800\n"
        "Creating registry key Release under #\\CurrentVersion with value 7\n"
        "Creating registry key Version under #\\CurrentVersion with value 9\n"
        "Creating registry key Service Level under #\\CurrentVersion with value BUILD\n"
        "Creating registry key  under #\\PROFILES with value \n"
        "Creating registry key KZ7PATH under #\\GLOBAL_PROFILE with value @\n"
        "Creating registry key  under #\\Das_PROFILES with value \n";
    return filled(lines, kCopies + "\\" + name, location) + filled(lines, kCopies32 + "\\" + name, location);
}

std::string copyDump(const std::string& key, const std::string& location) {
    return filled(
        "# : KZ7 Path Name = 1:@\\x00\n"
        "[#\\Components] \n#\\Components : BASE_CLIENT = 1:\\x00\n#\\Components : MULTI_VERSION_SUPPORT = 1:\\x00\n"
        "[#\\CurrentVersion] \n#\\CurrentVersion : Modification = 1:800\\x00\n#\\CurrentVersion : Release = 1:7\\x00\n"
        "#\\CurrentVersion : Version = 1:9\\x00\n#\\CurrentVersion : Service Level = 1:BUILD\\x00\n"
        "[#\\Das_PROFILES] \n#\\Das_PROFILES :  = 1:\\x00\n"
        "[#\\GLOBAL_PROFILE] \n#\\GLOBAL_PROFILE : KZ7PATH = 1:@\\x00\n"
        "[#\\PROFILES] \n#\\PROFILES :  = 1:\\x00\n",
        key, location);
}

TEST(AddCopy, WritesBothViewsTheServiceAndItsEventSource) {
    Machine machine;
    EXPECT_EQ(machine.result({"-ADDkz7copy", "COPY1", "C:\\old\\100%s"}),
              addLines("COPY1", "C:\\old\\100%s") + "COPY1 install copy at C:\\old\\100%s added successfully\n||0");
    for (const std::string& key : {kCopies + "\\COPY1", kCopies32 + "\\COPY1"}) {
        EXPECT_EQ(machine.dump(key), copyDump(key, "C:\\old\\100%s"));
    }
    EXPECT_EQ(machine.values(kCopies), "") << "no value beside the copies";
    EXPECT_EQ(machine.dump(kEventSource), kEventSource +
                                              " : EventMessageFile = 2:C:\\old\\100%s\\bin\\kz7wint64.dll\\x00\n" +
                                              kEventSource + " : TypesSupported = 4:\\x07\\x00\\x00\\x00\n");
    EXPECT_EQ(machine.service("KZ7MGMTSVC_COPY1"),
              filled("# : Type = 4:\\x10\\x00\\x00\\x00\n# : Start = 4:\\x02\\x00\\x00\\x00\n"
                     "# : ErrorControl = 4:\\x01\\x00\\x00\\x00\n# : ImagePath = 2:@\\bin\\kz7mgmtsvc.exe\\x00\n"
                     "# : DisplayName = 1:KZ7 Management Service (COPY1)\\x00\n# : ObjectName = 1:LocalSystem\\x00\n",
                     "SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_COPY1", "C:\\old\\100%s"))
        << "automatic and stopped";
    EXPECT_EQ(machine.registry_.commits(), 1U);

    EXPECT_EQ(machine.run({"-addKZ7Copy", "copy1", "C:\\new\\"}), kSuccess);
    EXPECT_EQ(machine.dump(kCopies), "[" + kCopies + "\\COPY1] \n" + copyDump(kCopies + "\\COPY1", "C:\\new\\"))
        << "the first spelling of the name stays";
    EXPECT_NE(machine.service("KZ7MGMTSVC_COPY1").find("= 2:C:\\old\\100%s\\bin\\kz7mgmtsvc.exe\\x00"),
              std::string::npos)
        << "an existing service is left";
    EXPECT_NE(machine.dump(kEventSource).find("C:\\old\\100%s\\bin"), std::string::npos) << "and its source";
    machine.run({"-addKZ7Copy", "COPY2", "C:\\two\\"});
    EXPECT_NE(machine.dump(kEventSource).find("C:\\two\\\\bin\\kz7wint64.dll"), std::string::npos)
        << "one source for all copies, the last one's file";
}

TEST(AddCopy, UsesNamesUnchanged) {
    const std::string token = "$CurrentInstallationName$";
    // clang-format off
    const struct { const char* why; std::string name; std::string key; Status status; } rows[] = {
        {"blanks, quotes, percent signs",         " a \"%s%n\" ",         " a \"%s%n\" ",       kSuccess},
        {"over 64 characters",                    std::string(80, 'n'),   std::string(80, 'n'), kSuccess},
        {"the empty name leaves the placeholder", "",                     token,                kSuccess},
        {"a name that holds the placeholder",     token,                  token,                kSuccess},
        {"over 255 characters is no key name",    std::string(256, 'n'),  "",                   kInvalidParameter},
        {"over 1,023 characters of path",         std::string(1000, 'n'), "",                   kFilenameExceedsRange},
    };
    // clang-format on
    for (const auto& row : rows) {
        Machine machine;
        EXPECT_EQ(machine.run({"-addKZ7Copy", row.name, "C:\\KZ7"}), row.status) << row.why;
        EXPECT_EQ(machine.has(kCopies + "\\" + row.key + "\\GLOBAL_PROFILE"), row.status == kSuccess) << row.why;
        EXPECT_EQ(machine.has("SOFTWARE"), row.status == kSuccess) << row.why;
        EXPECT_EQ(machine.console_.error.empty(), row.status == kSuccess) << row.why;
    }
    const std::string longName(256, 'n');
    const std::string failure = kPrefix + "392: An error occurred while creating the registry key KZ7 Path Name under ";
    Machine machine;
    machine.run({"-addKZ7Copy", longName, "C:\\KZ7"});
    EXPECT_EQ(machine.console_.error, failure + kCopies + "\\" + longName + " with value C:\\KZ7 : rc= 87\n" + failure +
                                          kCopies32 + "\\" + longName + " with value C:\\KZ7 : rc= 87\n" + kPrefix +
                                          "941: Unable to add a new copy of KZ7 to this machine : rc = 87\n");
    EXPECT_EQ(machine.result({"-addKZ7Copy", "a\\b", "C:\\KZ7"}),
              addLines("a\\b", "C:\\KZ7") +
                  "An error occurred while registering the KZ7 Management Service\n"
                  "The KZ7 Management service could not be started - some function not \n"
                  "yet ported to the new registry layout may not function properly\n|" +
                  kPrefix + "1775: Failed to create service- error code 123\n" + kPrefix +
                  "941: Unable to add a new copy of KZ7 to this machine : rc = 123\n|123")
        << "a separator makes a key below, but no service can have it";
}

TEST(RemoveCopy, DeletesTheNativeTreeAndTheServiceAndTheLastOneTheProduct) {
    Machine machine;
    machine.addService("KZ7MGMTSVC_COPY1", true);
    machine.run({"-addKZ7Copy", "COPY1", "C:\\one"});
    machine.set(kCopies, "9", "COPY1");
    machine.run({"-addKZ7Copy", "COPY2", "C:\\two"});
    const std::string before = machine.dump();
    EXPECT_EQ(machine.result({"-removeKZ7Copy", "%s"}), "The KZ7 Copy %s was not found\n||5021");
    EXPECT_EQ(machine.dump(), before);

    EXPECT_EQ(machine.result({"-removekz7copy", "copy1"}), "The KZ7 Copy copy1 has been removed||0");
    EXPECT_EQ(machine.dump(kCopies),
              kCopies + " : 9 = 1:COPY1\\x00\n[" + kCopies + "\\COPY2] \n" + copyDump(kCopies + "\\COPY2", "C:\\two"));
    EXPECT_TRUE(machine.has(kCopies32 + "\\COPY1\\Components"));
    EXPECT_EQ(machine.service("KZ7MGMTSVC_COPY1"), "") << "a running one is stopped and deleted";
    EXPECT_NE(machine.service("KZ7MGMTSVC_COPY2"), "");

    const std::string stem(64, 'n');
    const std::string longest(255, 'k');
    for (const std::string& name : {stem + "one", stem + "two", longest}) {
        machine.set(compose("%s\\%s", {kCopies, name}), "KZ7 Path Name", "C:\\x");
    }
    EXPECT_EQ(machine.run({"-removeKZ7Copy", stem}), kMissingItem) << "it agrees in 64 characters only";
    EXPECT_EQ(machine.run({"-removeKZ7Copy", stem + "TWO"}), kSuccess);
    EXPECT_TRUE(machine.has(kCopies + "\\" + stem + "one") && !machine.has(kCopies + "\\" + stem + "two"));
    for (const std::string& name : {stem + "one", longest}) {
        EXPECT_EQ(machine.run({"-removeKZ7Copy", name}), kSuccess);
        EXPECT_TRUE(machine.has(kCopies + "\\COPY2") && !machine.has(compose("%s\\%s", {kCopies, name})));
    }
    machine.set(kCopies + "\\NoService", "KZ7 Path Name", "C:\\x");
    EXPECT_EQ(machine.result({"-removeKZ7Copy", "NoService"}), "The KZ7 Copy NoService has been removed||0");
    machine.set("SOFTWARE\\NVQ\\KZ7\\Other", "v", "");
    EXPECT_EQ(machine.result({"-removeKZ7Copy", "COPY2"}), "The KZ7 Copy COPY2 has been removed||0");
    EXPECT_FALSE(machine.has("SOFTWARE\\NVQ\\KZ7"));
    EXPECT_TRUE(machine.has("SOFTWARE\\NVQ"));
    EXPECT_TRUE(machine.has(kCopies32 + "\\COPY2"));
    EXPECT_EQ(machine.service("KZ7MGMTSVC_COPY2"), "");
    EXPECT_EQ(machine.run({"-removeKZ7Copy", "COPY2"}), kMissingItem);
}

// The low 8 bits on hosts that keep no more, but never 0 for a failure.
TEST(CommandLine, ExitCodesAreStatusesOrTheirLowBits) {
    const struct {
        Status status;
        int whole;
        int low;
    } rows[] = {
        {kSuccess, 0, 0}, {kInvalidParameter, 87, 87}, {kMissingItem, 5021, 157}, {512, 512, 1}, {kFailed, -1, 255}};
    for (const auto& row : rows) {
        EXPECT_EQ(hostExitCode(row.status), kExitCodesAreWhole ? row.whole : row.low);
    }
}

TEST(CommandLine, AnythingElsePrintsTheUsage) {
    const std::vector<std::string> rows[] = {
        {},
        {"-v9"},
        {"-addKZ7Copy", "name"},
        {"-v9", "a", "b"},
        {"-removeKZ7Copy", "a", "b"},
        {"addKZ7Copy", "a", "b"},
        {"", ""},
        {"-addKZ7Copy", "a", "b", "c"},
    };
    for (const auto& row : rows) {
        Machine machine;
        EXPECT_EQ(machine.result(row),
                  "Supported Command Line Options\n\n\n -addKZ7Copy [installName] [installLocation] - this will set up "
                  "a computer to for \n very basic KZ7 functionality. This option depends on a valid directory "
                  "existing \n with all of the files needed for KZ7 to operate properly that is specified with \n the "
                  "[installLocation] parameter.  The [installname] parameter is a name specified \n to refer to this "
                  "copy.  This will only have very basic functionality - no  \n instance and no KZ7 Administration "
                  "server will be setup \n installName without any instances and this copy can be used like a \n "
                  "multiple copy version.  This option will also not set up any shortcuts \n or system environment "
                  "variables.\n\n\n -removeKZ7Copy [installName] - this can remove a copy that has been created using "
                  "\n -addKZ7Copy.  This cannot be used to remove a copy installed with the KZ7 Setup Wizard\n \n||87");
        EXPECT_EQ(machine.dump(), "");
    }
}

}  // namespace
}  // namespace kz7::test
