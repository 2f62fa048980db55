// kz7admin commit as a program, with the sample's command processor, alone and under the front end.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>

#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

namespace fs = std::filesystem;

class CommitProgram : public testing::Test {
protected:
    CommitProgram() {
        const fs::path copy = store_.file("drive_c/copy1");
        fs::create_directories(copy.parent_path());
        fs::copy(KZ7_SAMPLE, copy, fs::copy_options::recursive);
        fs::create_directories(store_.file("drive_c/prof/INST"));
        overwrite(store_.file("drive_c/prof/INST/kz7systm"), "");
        EXPECT_EQ(store_.tool({"-addKZ7Copy", "COPY1", "C:\\copy1"}).exitCode, 0);
    }

    std::string responses(const std::string& lines) const {
        overwrite(files_.path() + "/responses", lines);
        return files_.path() + "/responses";
    }
    ProgramResult commit(const std::string& lines, std::vector<std::string> more, ProgramOptions options = {}) const {
        more.insert(more.begin(), {"commit", "--copy", "copy1", "--response-file", responses(lines)});
        return store_.run("kz7admin", std::move(more), std::move(options));
    }

    StateDirectory store_;
    TemporaryDirectory files_;
};

constexpr const char* kGood = "* for an instance\nPROD = X\nKZ7INSTPROF = C:\\prof\nKZ7ACCOUNT = me\nDIAGLEVEL = 3\n";

TEST_F(CommitProgram, SetsTheValuesOfAResponseFile) {
    const ProgramResult human = commit(kGood, {"--instance", "INST"});
    EXPECT_EQ(human.exitCode, 0) << human.error;
    EXPECT_EQ(human.output,
              "Setting registry variables ...\nSetting registry variables: done\n"
              "Setting database-manager parameters ...\nSetting database-manager parameters: done\n"
              "copy1: 3 set, 0 not set; the log is " +
                  store_.file("kz7msi.log") + "\nchanged: 2 values, 1 key\n");
    const std::string kept = contents(store_.file("kz7msi.log"));
    EXPECT_NE(kept.find("Note: Database-manager parameter set: DIAGLEVEL=3, instance INST\n"), std::string::npos)
        << kept;
    EXPECT_NE(store_.dump().find("COPY1\\PROFILES\\INST : KZ7ACCOUNT = 1:me\\x00\n"), std::string::npos);

    const ProgramResult lost =
        store_.shell("kz7admin commit --copy COPY1 --response-file " + responses("KZ7COMM = a\nNOPE = 1\n") + " >&-");
    EXPECT_EQ(lost.exitCode, 1) << "exits by what was set";
    EXPECT_TRUE(lost.error.starts_with("Error: ") &&
                lost.error.ends_with("\nkz7admin: cannot write: standard output: error 29\n"))
        << lost.error;

    const ProgramResult machine = store_.run(
        "kz7admin", {"front", "--", programPath("kz7admin"), "--store", store_.path(), "commit", "--copy", "COPY1",
                     "--response-file", responses("KZ7LDAPHOST = l\nNOPE = 1\nKZ7ATLD_PORTS = 1\nDIAGLEVEL = 3\n"),
                     "--machine", "--log", files_.path() + "/setup.log"});
    EXPECT_EQ(machine.exitCode, 1);
    EXPECT_NE(machine.output.find("The log is " + files_.path() + "/setup.log\n"), std::string::npos) << machine.output;
    EXPECT_NE(machine.error.find("NOPE (line 2 of the response file)"), std::string::npos) << machine.error;
    EXPECT_NE(machine.error.find("DIAGLEVEL=3, instance , error 5056"), std::string::npos) << machine.error;
    EXPECT_NE(store_.dump().find("COPY1\\GLOBAL_PROFILE : KZ7LDAPHOST = 1:l\\x00\n"), std::string::npos);
}

TEST_F(CommitProgram, ReportsWhyItCannotBegin) {
    const std::string before = store_.dump();
    const std::string pipe = files_.path() + "/pipe";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    const std::string good = responses(kGood);
    // clang-format off
    const struct { const char* why; std::string copy; std::string responses; std::vector<std::string> more; std::string error; } rows[] = {
        {"no such copy",        "C2",              good, {}, "no such copy: C2 (see kz7admin copies)"},
        {"no copy's name",      "COPY1\\PROFILES", good, {}, "no such copy: COPY1\\PROFILES (see kz7admin copies)"},
        {"no response file",    "COPY1", "/nowhere", {}, "/nowhere: No such file or directory"},
        {"a long instance",     "COPY1", good, {"--instance", "INSTANCE9"}, "invalid instance name: INSTANCE9: at most 8 characters, no separators"},
        {"another folder",      "COPY1", good, {"--instance", ".."}, "invalid instance name: ..: at most 8 characters, no separators"},
        {"no folder for a log", "COPY1", good, {"--log", "/nowhere/l"}, "cannot write log: /nowhere/l: no such directory"},
        {"a pipe for a log",    "COPY1", good, {"--log", pipe}, "cannot write log: " + pipe + ": permission denied"},
    };
    // clang-format on
    for (const auto& row : rows) {
        std::vector<std::string> words = {"commit", "--copy", row.copy, "--response-file", row.responses};
        words.insert(words.end(), row.more.begin(), row.more.end());
        EXPECT_EQ(store_.run("kz7admin", words), (ProgramResult{2, "", "kz7admin: " + row.error + "\n"})) << row.why;
    }
    const ProgramResult bad = commit("KZ7ACCOUNT = me\nwhat\n", {});
    EXPECT_EQ(bad.exitCode, 2);
    EXPECT_TRUE(bad.error.ends_with("/responses:2: there is no '=' in it\n")) << bad.error;
    EXPECT_EQ(store_.dump(), before) << "the whole file is read before anything is set";
}

TEST_F(CommitProgram, ReportsTheResultOfTheProcessor) {
    const std::string set = "parameter set: DIAGLEVEL=3";
    // clang-format off
    const struct { const char* why; std::string variable; int exitCode; std::string log; } rows[] = {
        {"it fails",                      "KZ7_SAMPLE_EXIT=7", 1, "error 5030: exit code 7\nNote: Output of setDBMUsingProcess: "},
        {"it sees what was set, and writes", "KZ7_SAMPLE_HOOK=\"$KZ7_ADMIN\" tree | grep -q KZ7ACCOUNT && \"$KZ7_TOOL\" -addKZ7Copy C2 'C:\\c2' >&2", 0, set},
        {"it floods its output",          "KZ7_SAMPLE_HOOK=head -c 104857600 /dev/zero | tr '\\0' x", 0, set},
        {"it leaves somebody behind",     "KZ7_SAMPLE_HOOK=f=$KZ7_STATE_DIR/pipe; mkfifo $f; (cat $f & echo late >$f &)", 0, set},
        {"it reads its input",            "KZ7_SAMPLE_HOOK=cat", 0, set},
        {"it is missing",                 "", 1, "setDBMUsingProcess, step 20: error 5082"},
    };
    // clang-format on
    const std::string file = files_.path() + "/log";
    for (const auto& row : rows) {
        fs::remove(file);
        if (row.variable.empty()) {
            fs::remove(store_.file("drive_c/copy1/bin/kz7cmd.exe"));
        }
        const ProgramResult result = commit(kGood, {"--instance", "INST", "--log", file},
                                            {.environment = {row.variable, "KZ7_ADMIN=" + programPath("kz7admin"),
                                                             "KZ7_TOOL=" + programPath("kz7InstallReg")},
                                             .inChild = {}});
        EXPECT_NE(contents(file).find(row.log), std::string::npos) << row.why << "\n" << contents(file);
        EXPECT_EQ(result.exitCode, row.exitCode) << row.why;
    }
}

}  // namespace
}  // namespace kz7::test
