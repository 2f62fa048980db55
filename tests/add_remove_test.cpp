// Adding and removing copies, and the command line that asks for it: exact lines, statuses and registries.
#include <gtest/gtest.h>

#include "install/platform/text.h"
#include "tests/support/machine.h"

namespace kz7::test {
namespace {

const std::string kCopies = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies";
const std::string kEventSource = "SYSTEM\\CurrentControlSet\\Services\\EventLog\\Application\\KZ7 Management Service";

std::string creatingLines(const std::string& root, const std::string& location) {
    const char* const rows[][3] = {
        {"KZ7 Path Name", "", "<location>"},
        {"BASE_CLIENT", "\\Components", ""},
        {"MULTI_VERSION_SUPPORT", "\\Components", ""},
        {"Modification", "\\CurrentVersion", "800"},
        {"Release", "\\CurrentVersion", "7"},
        {"Version", "\\CurrentVersion", "9"},
        {"Service Level", "\\CurrentVersion", "BUILD"},
        {"", "\\PROFILES", ""},
        {"KZ7PATH", "\\GLOBAL_PROFILE", "<location>"},
        {"", "\\Das_PROFILES", ""},
    };
    std::string lines;
    for (const auto& row : rows) {
        const std::string data = std::string(row[2]) == "<location>" ? location : row[2];
        lines +=
            "Creating registry key " + std::string(row[0]) + " under " + root + row[1] + " with value " + data + "\n";
    }
    return lines;
}

std::string addLines(const std::string& name, const std::string& location) {
    return creatingLines(kCopies + "\\" + name, location) +
           creatingLines("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\" + name, location);
}

std::string copyDump(const std::string& root, const std::string& location) {
    return root + " : KZ7 Path Name = 1:" + location + "\\x00\n[" +            //
           root + "\\Components] \n" +                                         //
           root + "\\Components : BASE_CLIENT = 1:\\x00\n" +                   //
           root + "\\Components : MULTI_VERSION_SUPPORT = 1:\\x00\n[" +        //
           root + "\\CurrentVersion] \n" +                                     //
           root + "\\CurrentVersion : Modification = 1:800\\x00\n" +           //
           root + "\\CurrentVersion : Release = 1:7\\x00\n" +                  //
           root + "\\CurrentVersion : Version = 1:9\\x00\n" +                  //
           root + "\\CurrentVersion : Service Level = 1:BUILD\\x00\n[" +       //
           root + "\\Das_PROFILES] \n" +                                       //
           root + "\\Das_PROFILES :  = 1:\\x00\n[" +                           //
           root + "\\GLOBAL_PROFILE] \n" +                                     //
           root + "\\GLOBAL_PROFILE : KZ7PATH = 1:" + location + "\\x00\n[" +  //
           root + "\\PROFILES] \n" +                                           //
           root + "\\PROFILES :  = 1:\\x00\n";
}

TEST(AddCopy, WritesBothViewsTheServiceAndItsEventSource) {
    Machine machine;
    EXPECT_EQ(machine.run({"-ADDkz7copy", "COPY1", "C:\\KZ7\\100%s"}), kSuccess);
    EXPECT_EQ(machine.console_.output,
              addLines("COPY1", "C:\\KZ7\\100%s") + "COPY1 install copy at C:\\KZ7\\100%s added successfully\n");
    EXPECT_EQ(machine.console_.error, "");
    EXPECT_EQ(machine.dump(kCopies + "\\COPY1"), copyDump(kCopies + "\\COPY1", "C:\\KZ7\\100%s"));
    const std::string other = "SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\COPY1";
    EXPECT_EQ(machine.dump(other), copyDump(other, "C:\\KZ7\\100%s"));
    EXPECT_EQ(machine.dump(kCopies).find(kCopies + " : "), std::string::npos) << "no value beside the copies";
    EXPECT_EQ(machine.dump(kEventSource), kEventSource +
                                              " : EventMessageFile = 2:C:\\KZ7\\100%s\\bin\\kz7wint64.dll\\x00\n" +
                                              kEventSource + " : TypesSupported = 4:\\x07\\x00\\x00\\x00\n");
    const auto* service = machine.services_.find("KZ7MGMTSVC_COPY1");
    ASSERT_NE(service, nullptr);
    EXPECT_EQ(service->displayName, "KZ7 Management Service (COPY1)");
    EXPECT_EQ(service->programPath, "C:\\KZ7\\100%s\\bin\\kz7mgmtsvc.exe");
    EXPECT_EQ(service->start, ServiceStart::automatic);
    EXPECT_EQ(service->state, ServiceState::stopped);
    EXPECT_EQ(machine.registry_.openHandles() + machine.services_.openHandles(), 0U);
    EXPECT_EQ(machine.registry_.commits(), 1U);
}

TEST(AddCopy, AgainTakesTheNewLocationButLeavesTheService) {
    Machine machine;
    machine.run({"-addKZ7Copy", "COPY1", "C:\\old"});
    EXPECT_EQ(machine.run({"-addKZ7Copy", "copy1", "C:\\new\\"}), kSuccess);
    EXPECT_EQ(machine.dump(kCopies), "[" + kCopies + "\\COPY1] \n" + copyDump(kCopies + "\\COPY1", "C:\\new\\"))
        << "the first spelling of the name stays";
    EXPECT_EQ(machine.services_.find("KZ7MGMTSVC_COPY1")->programPath, "C:\\old\\bin\\kz7mgmtsvc.exe");
    EXPECT_NE(machine.dump(kEventSource).find("C:\\old\\bin\\kz7wint64.dll"), std::string::npos);
    machine.run({"-addKZ7Copy", "COPY2", "C:\\two\\"});
    EXPECT_NE(machine.dump(kEventSource).find("C:\\two\\\\bin\\kz7wint64.dll"), std::string::npos)
        << "one source for all copies, the last one's file";
}

TEST(AddCopy, NamesAreTakenAsTheyStand) {
    const struct {
        const char* why;
        std::string name;
        std::string key;
        Status status;
    } rows[] = {
        {"blanks, quotes, percent signs", " a \"%s%n\" ", " a \"%s%n\" ", kSuccess},
        {"over 64 characters", std::string(80, 'n'), std::string(80, 'n'), kSuccess},
        {"the empty name leaves the placeholder", "", "$CurrentInstallationName$", kSuccess},
        {"a name that holds the placeholder", "$CurrentInstallationName$", "$CurrentInstallationName$", kSuccess},
        {"a separator makes a key below, but no service can have it", "a\\b", "a\\b", kInvalidName},
        {"over 255 characters is no key name", std::string(256, 'n'), "", kInvalidParameter},
        {"over 1,023 characters of path", std::string(1000, 'n'), "", kFilenameExceedsRange},
    };
    for (const auto& row : rows) {
        Machine machine;
        EXPECT_EQ(machine.run({"-addKZ7Copy", row.name, "C:\\KZ7"}), row.status) << row.why;
        if (!row.key.empty()) {
            EXPECT_TRUE(machine.has(kCopies + "\\" + row.key + "\\GLOBAL_PROFILE")) << row.why;
        } else {
            EXPECT_FALSE(machine.has("SOFTWARE")) << row.why;
            EXPECT_EQ(machine.console_.error,
                      compose("install\\src\\uselvlkz7reg.cpp:392: An error occurred while creating the registry key "
                              "KZ7 Path Name under %s\\%s with value C:\\KZ7 : rc= %d\n"
                              "install\\src\\uselvlkz7reg.cpp:392: An error occurred while creating the registry key "
                              "KZ7 Path Name under SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\%s with value "
                              "C:\\KZ7 : rc= %d\n"
                              "install\\src\\uselvlkz7reg.cpp:941: Unable to add a new copy of KZ7 to this machine : "
                              "rc = %d\n",
                              {kCopies, row.name, row.status, row.name, row.status, row.status}))
                << row.why;
        }
    }
}

TEST(AddCopy, AServiceThatCannotBeMadeIsTold) {
    Machine machine;
    EXPECT_EQ(machine.run({"-addKZ7Copy", "a\\b", "C:\\KZ7"}), kInvalidName);
    EXPECT_EQ(machine.console_.output, addLines("a\\b", "C:\\KZ7") +
                                           "An error occurred while registering the KZ7 Management Service\n"
                                           "The KZ7 Management service could not be started - some function not \n"
                                           "yet ported to the new registry layout may not function properly\n");
    EXPECT_EQ(machine.console_.error,
              "install\\src\\uselvlkz7reg.cpp:1775: Failed to create service- error code 123\n"
              "install\\src\\uselvlkz7reg.cpp:941: Unable to add a new copy of KZ7 to this machine : rc = 123\n");
}

TEST(RemoveCopy, OneOfTwoTakesItsNativeTreeAndService) {
    Machine machine;
    machine.run({"-addKZ7Copy", "COPY1", "C:\\one"});
    machine.set(kCopies, "9", "COPY1");
    machine.run({"-addKZ7Copy", "COPY2", "C:\\two"});
    EXPECT_EQ(machine.run({"-removekz7copy", "copy1"}), kSuccess);
    EXPECT_EQ(machine.console_.output, "The KZ7 Copy copy1 has been removed");
    EXPECT_EQ(machine.console_.error, "");
    EXPECT_EQ(machine.dump(kCopies),
              kCopies + " : 9 = 1:COPY1\\x00\n[" + kCopies + "\\COPY2] \n" + copyDump(kCopies + "\\COPY2", "C:\\two"));
    EXPECT_TRUE(machine.has("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\COPY1\\Components"));
    EXPECT_EQ(machine.services_.find("KZ7MGMTSVC_COPY1"), nullptr);
    EXPECT_NE(machine.services_.find("KZ7MGMTSVC_COPY2"), nullptr);
    EXPECT_EQ(machine.registry_.openHandles() + machine.services_.openHandles(), 0U);
}

TEST(RemoveCopy, TheLastOneTakesTheProductTree) {
    Machine machine;
    machine.run({"-addKZ7Copy", "COPY1", "C:\\one"});
    machine.set("SOFTWARE\\NVQ\\KZ7\\Other", "v", "");
    EXPECT_EQ(machine.run({"-removeKZ7Copy", "COPY1"}), kSuccess);
    EXPECT_FALSE(machine.has("SOFTWARE\\NVQ\\KZ7"));
    EXPECT_TRUE(machine.has("SOFTWARE\\NVQ"));
    EXPECT_TRUE(machine.has("SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\COPY1"));
    EXPECT_EQ(machine.run({"-removeKZ7Copy", "COPY1"}), kMissingItem);
}

TEST(RemoveCopy, AnUnknownNameChangesNothing) {
    Machine machine;
    machine.run({"-addKZ7Copy", "COPY1", "C:\\one"});
    const std::string before = machine.dump();
    EXPECT_EQ(machine.run({"-removeKZ7Copy", "%s"}), kMissingItem);
    EXPECT_EQ(machine.console_.output, "The KZ7 Copy %s was not found\n");
    EXPECT_EQ(machine.dump(), before);
}

TEST(RemoveCopy, ARunningServiceIsStoppedAndAMissingOneIsSilent) {
    Machine machine;
    machine.files_.add("C:\\one\\bin\\kz7mgmtsvc.exe");
    machine.run({"-addKZ7Copy", "COPY1", "C:\\one"});
    {
        OwnedService manager(machine.services_);
        OwnedService service(machine.services_);
        machine.services_.openManager(kServiceManagerAllAccess, manager.receive());
        machine.services_.openService(manager.get(), "KZ7MGMTSVC_COPY1", kServiceAllAccess, service.receive());
        ASSERT_EQ(machine.services_.startService(service.get()), kSuccess);
    }
    EXPECT_EQ(machine.run({"-removeKZ7Copy", "COPY1"}), kSuccess);
    EXPECT_EQ(machine.services_.count(), 0U);
    machine.set(kCopies + "\\NoService", "KZ7 Path Name", "C:\\x");
    EXPECT_EQ(machine.run({"-removeKZ7Copy", "NoService"}), kSuccess);
    EXPECT_EQ(machine.console_.error, "");
}

TEST(CommandLine, AnythingElsePrintsTheUsage) {
    const std::vector<std::string> rows[] = {
        {},
        {"-v9"},
        {"-addKZ7Copy", "name"},
        {"-v9", "a", "b"},
        {"-removeKZ7Copy", "a", "b"},
        {"-addKZ7Copy", "a", "b", "c"},
        {"addKZ7Copy", "a", "b"},
        {"", ""},
    };
    for (const auto& row : rows) {
        Machine machine;
        EXPECT_EQ(machine.run(row), kInvalidParameter);
        EXPECT_EQ(machine.console_.output,
                  "Supported Command Line Options\n\n\n -addKZ7Copy [installName] [installLocation] - this will set up "
                  "a computer to for \n very basic KZ7 functionality. This option depends on a valid directory "
                  "existing \n with all of the files needed for KZ7 to operate properly that is specified with \n the "
                  "[installLocation] parameter.  The [installname] parameter is a name specified \n to refer to this "
                  "copy.  This will only have very basic functionality - no  \n instance and no KZ7 Administration "
                  "server will be setup \n installName without any instances and this copy can be used like a \n "
                  "multiple copy version.  This option will also not set up any shortcuts \n or system environment "
                  "variables.\n\n\n -removeKZ7Copy [installName] - this can remove a copy that has been created using "
                  "\n -addKZ7Copy.  This cannot be used to remove a copy installed with the KZ7 Setup Wizard\n \n");
        EXPECT_EQ(machine.console_.error, "");
        EXPECT_EQ(machine.dump(), "");
    }
}

}  // namespace
}  // namespace kz7::test
