// The provider registration, and its result in kz7admin, with a real library and real programs.
#include <gtest/gtest.h>

#include <unistd.h>

#include <filesystem>

#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

class ProviderProgram : public testing::Test {
protected:
    ProviderProgram() {
        std::filesystem::create_directories(store_.file("drive_c/KZ7"));
        std::filesystem::copy(KZ7_SAMPLE_BIN, store_.file("drive_c/KZ7/bin"), std::filesystem::copy_options::recursive);
        overwrite(store_.file("drive_c/KZ7/bin/KZ7NMPdata.DLL"), "");
        overwrite(store_.file("drive_c/KZ7/bin/kz7nmpdata.txt"), "");
    }

    StateDirectory store_;
};

const std::string kPrefix = "install\\src\\uselvlkz7reg.cpp:";

TEST_F(ProviderProgram, RegistersWhileItsProgramsUseTheStore) {
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "COPY1", "C:\\KZ7"}).exitCode, 0);
    // Each program adds a copy, which it could not do while its parent holds a transaction.
    const std::string hook = programPath("kz7InstallReg") + " -addKZ7Copy CHILD 'C:\\child' && " +
                             programPath("kz7admin") + " tree 'SOFTWARE\\Classes' | grep -q KZ7NMPdata";
    EXPECT_EQ(store_.tool({"-dotnet", "C:\\KZ7\\"}, {{"KZ7_SAMPLE_HOOK=" + hook}, {}}),
              (ProgramResult{0,
                             "Level Returned: 9.1.0.0\n"
                             "C:\\KZ7\\bin\\kz7nmpcfg.exe -register -level 9.1.0 -kz7path C:\\KZ7\\\n"
                             "C:\\KZ7\\bin\\kz7nmpcfg_32.exe -register -level 9.1.0 -kz7path C:\\KZ7\\\n -migratev8 ",
                             ""}));
    const std::string records =
        "SOFTWARE\\Classes\\Installer\\Assemblies\\Global : KZ7NMPdata.DLL,level=\"9.1.0\","
        "generation=\"";
    const std::string dump = store_.dump();
    for (const char* record : {"1", "2"}) {
        EXPECT_NE(dump.find(records + record + "\" = 1:C:\\KZ7\\bin\\KZ7NMPdata.DLL\\x00\n"), std::string::npos)
            << dump;
    }
    EXPECT_EQ(dump.find("kz7nmpdata.txt"), std::string::npos);
}

TEST_F(ProviderProgram, ErrorsAreInOrderWithTheOutput) {
    const ProgramResult refused = store_.shell("kz7InstallReg -dotnet 'C:\\KZ7' 2>&1", {{"KZ7_SAMPLE_EXIT=5"}, {}});
    EXPECT_EQ(refused.exitCode, 255) << "no copies, no aliases";
    EXPECT_EQ(refused.output,
              "Level Returned: 9.1.0.0\n"
              "C:\\KZ7\\bin\\kz7nmpcfg.exe -register -level 9.1.0 -kz7path C:\\KZ7" +
                  kPrefix +
                  "1677: kz7nmpcfg.exe returned an error. rc = 5\n"
                  "C:\\KZ7\\bin\\kz7nmpcfg_32.exe -register -level 9.1.0 -kz7path C:\\KZ7 -migratev8 " +
                  kPrefix + "1697: kz7nmpcfg_32.exe returned an error. rc = 5\n");
    const ProgramResult watched = store_.tool({"-dotnet", "C:\\KZ7"}, {{"KZ7_DEBUG=1"}, {}});
    EXPECT_EQ(watched.error,
              "debug: Failed to open the registry key: SOFTWARE\\NVQ\\KZ7\\InstalledCopies\n"
              "debug: Failed to backup the old profile info\n")
        << "texts for a debugger, shown when asked for";
    EXPECT_TRUE(store_.shell("kz7InstallReg -v8 'C:\\KZ8' 2>&1")
                    .output.starts_with("Creating version 8 registry\n" + kPrefix + "1466: "));
}

TEST_F(ProviderProgram, LostOutputAndHostileTextsAreOneLineEach) {
    EXPECT_EQ(store_.shell("kz7InstallReg -addKZ7Copy C 'C:\\c' >/dev/full"),
              (ProgramResult{0, "", "kz7InstallReg: cannot write standard output: error 112\n"}));
    EXPECT_EQ(store_.shell("kz7InstallReg -removeKZ7Copy NONE 2>&1 | true").error, "") << "a reader that is gone";
    const std::string hostile = store_.file("\x1b[2J\xD8\x9C");
    overwrite(hostile, "");
    const ProgramResult escaped =
        runProgram({programPath("kz7InstallReg"), "-removeKZ7Copy", "C"}, {{"KZ7_STATE_DIR=" + hostile}, {}});
    EXPECT_NE(escaped.error.find("/\\x1b[2J\\u061c"), std::string::npos) << escaped.error;
}

TEST_F(ProviderProgram, UsesNothingFromTheCurrentDirectory) {
    const std::string parent = store_.file("drive_c");
    const ProgramResult result = store_.tool({"-addv9", "KZ7", "C:\\KZ7"},
                                             {{}, [&] { [[maybe_unused]] const int moved = chdir(parent.c_str()); }});
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.error, kPrefix + "601: Unable to load KZ7\\bin\\kz7install64.dll\n" + kPrefix +
                                "607: Unable to retrieve the version of the sqllib\n" + kPrefix +
                                "1668: Failed to execute kz7nmpcfg.exe command.  rc = 5082\n" + kPrefix +
                                "1689: Failed to execute kz7nmpcfg_32.exe command.  rc = 5082\n");
    EXPECT_EQ(store_.dump().find("KZ7NMPdata"), std::string::npos);
}

TEST_F(ProviderProgram, ShowsCopiesWithTheirServicesAndWrongAliases) {
    const std::string storeLine = store_.file("registry.db");
    EXPECT_EQ(store_.run("kz7admin", {"copies"}),
              (ProgramResult{1, "", "kz7admin: no installed copy: " + storeLine + "\n"}));
    EXPECT_EQ(store_.run("kz7admin", {"aliases"}).exitCode, 1);

    store_.tool({"-addKZ7Copy", "COPY1", "C:\\KZ7"});
    const std::string text =
        "Windows Registry Editor Version 5.00\n"
        "[HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies]\n\"8.2\"=\"GONE\"\n\"9.8.0\"=\"COPY1\"\n\"v9\"="
        "\"vee\"\n\"" +
        std::string(100, 'x') +
        "\"=\"\"\n\"8.1\"=\"GONE\"\n\"8.3\"=\"GONE\"\n"
        "[HKEY_LOCAL_MACHINE\\SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies]\n\"8.3\"=\"GONE\"\n\"large\"=\"" +
        std::string(1 << 20, 'x') +
        "\"\n"
        "[HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\five\\CurrentVersion]\n"
        "\"Version\"=\"9\"\n\"Release\"=\"8\"\n\"Modification\"=\"0\"\n\"Fix Level\"=\"0.1\"\n"
        "[HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\vee\\CurrentVersion]\n"
        "\"Version\"=\"v9\"\n\"Release\"=\"8\"\n\"Modification\"=\"0\"\n"
        "[HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\half]\n\"KZ7 Path Name\"=\"C:\\\\h\"\n";
    overwrite(store_.file("more.reg"), text);
    ASSERT_EQ(store_.run("kz7admin", {"import", store_.file("more.reg")}).exitCode, 0);

    EXPECT_EQ(store_.run("kz7admin", {"copies"}).output,
              "NAME   VIEW         VERSION    VALID  LOCATION  SERVICE\n"
              "COPY1  both         9.7.800.0  yes    C:\\KZ7    KZ7MGMTSVC_COPY1 stopped\n"
              "five   native only  9.8.0.0.1  yes    none      none\n"
              "half   native only  ...0       no     C:\\h      none\n"
              "vee    native only  v9.8.0.0   yes    none      none\n");
    const std::string json = store_.run("kz7admin", {"copies", "--json"}).output;
    EXPECT_EQ(json.substr(0, json.find(",\n")),
              "{\"schema\":1,\"store\":\"" + storeLine +
                  "\",\"copies\":[\n{\"name\":\"COPY1\",\"view\":\"native\",\"version\":\"9.7.800.0\",\"valid\":true,"
                  "\"location\":\"C:\\\\KZ7\",\"service\":\"KZ7MGMTSVC_COPY1\",\"state\":\"stopped\",\"default\":false,"
                  "\"removed\":false}");
    EXPECT_EQ(store_.run("kz7admin", {"aliases", "9.8"}).output,
              "PREFIX     NATIVE  32-BIT  SHOULD BE  WHY\n"
              "9.8        -       -       five       9.8.0.0.1 is the highest that begins with it\n"
              "9.8.0      COPY1   -       five       9.8.0.0.1 is the highest that begins with it\n"
              "9.8.0.0    -       -       (empty)    no copy has exactly this version; written empty\n"
              "9.8.0.0.1  -       -       (empty)    no version continues it; written empty\n");
    EXPECT_NE(store_.run("kz7admin", {"aliases", "v9"}).output.find("v9        vee     -       vee        v9.8.0.0 is"),
              std::string::npos)
        << "a due alias that does not look like one";
    const std::string gone = "no copy has such a version; the next rewrite ";
    const std::string ended = ": a value name of 100 characters or more ends its walk\n";
    EXPECT_EQ(store_.run("kz7admin", {"aliases", "8"}).output,
              "PREFIX  NATIVE  32-BIT  SHOULD BE  WHY\n"
              "8.1     GONE    -       -          " +
                  gone + "leaves it" + ended +                                     //
                  "8.2     GONE    -       -          " + gone + "deletes it\n" +  //
                  "8.3     GONE    GONE    -          " + gone + "deletes it from the 32-bit view only" + ended);
    const StateDirectory native;
    overwrite(store_.file("more.reg"), text.substr(0, text.find("[HKEY_LOCAL_MACHINE\\SOFTWARE\\Wow")));
    ASSERT_EQ(native.run("kz7admin", {"import", store_.file("more.reg")}).exitCode, 0);
    EXPECT_NE(native.run("kz7admin", {"aliases", "8.2"}).output.find(gone + "leaves it: the copies' key is missing"),
              std::string::npos);
}

}  // namespace
}  // namespace kz7::test
