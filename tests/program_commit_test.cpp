// kz7admin commit as people run it, with the sample's command processor, alone and under the front end.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <iterator>

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
        std::ofstream(store_.file("drive_c/prof/INST/kz7systm"));
        EXPECT_EQ(store_.tool({"-addKZ7Copy", "COPY1", "C:\\copy1"}).exitCode, 0);
    }

    std::string responses(const std::string& lines) const {
        std::ofstream(files_.path() + "/responses") << lines;
        return files_.path() + "/responses";
    }
    ProgramResult commit(const std::string& lines, std::vector<std::string> more, ProgramOptions options = {}) const {
        more.insert(more.begin(), {"commit", "--copy", "copy1", "--response-file", responses(lines)});
        return store_.run("kz7admin", std::move(more), std::move(options));
    }
    std::string log(const std::string& path) const {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), {}};
    }

    StateDirectory store_;
    TemporaryDirectory files_;
};

constexpr const char* kGood = "* for an instance\nPROD = X\nKZ7INSTPROF = C:\\prof\nKZ7ACCOUNT = me\nDIAGLEVEL = 3\n";

TEST_F(CommitProgram, SetsWhatAResponseFileSays) {
    const ProgramResult human = commit(kGood, {"--instance", "INST"});
    EXPECT_EQ(human.exitCode, 0) << human.error;
    EXPECT_EQ(human.output,
              "Setting registry variables ...\nSetting registry variables: done\n"
              "Setting database-manager parameters ...\nSetting database-manager parameters: done\n"
              "copy1: 3 set, 0 not set; the log is " +
                  store_.file("kz7msi.log") + "\n");
    const std::string kept = log(store_.file("kz7msi.log"));
    EXPECT_NE(kept.find("Note: Database-manager parameter set: DIAGLEVEL=3, instance INST\n"), std::string::npos)
        << kept;
    EXPECT_NE(store_.dump().find("COPY1\\PROFILES\\INST : KZ7ACCOUNT = 1:me\\x00\n"), std::string::npos);

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

TEST_F(CommitProgram, TellsWhyItCannotBegin) {
    const std::string before = store_.dump();
    const std::string pipe = files_.path() + "/pipe";
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    // clang-format off
    const struct { const char* why; std::vector<std::string> words; std::string told; } rows[] = {
        {"no such copy",      {"--copy", "C2", "--response-file", responses(kGood)}, "C2: there is no such copy (see kz7admin copies)"},
        {"no copy's name",    {"--copy", "COPY1\\PROFILES", "--response-file", responses(kGood)}, "COPY1\\PROFILES: there is no such copy (see kz7admin copies)"},
        {"no response file",  {"--copy", "COPY1", "--response-file", "/nowhere"}, "/nowhere: No such file or directory"},
        {"a long instance",   {"--copy", "COPY1", "--instance", "INSTANCE9", "--response-file", responses(kGood)}, "INSTANCE9: an instance name has at most 8 characters and no separator"},
        {"another folder",    {"--copy", "COPY1", "--instance", "..", "--response-file", responses(kGood)}, "..: an instance name has at most 8 characters and no separator"},
        {"no folder for a log", {"--copy", "COPY1", "--log", "/nowhere/l", "--response-file", responses(kGood)}, "/nowhere/l: the log cannot be written: error 3"},
        {"a pipe for a log",  {"--copy", "COPY1", "--log", pipe, "--response-file", responses(kGood)}, pipe + ": the log cannot be written: error 5"},
    };
    // clang-format on
    for (const auto& row : rows) {
        std::vector<std::string> words = row.words;
        words.insert(words.begin(), "commit");
        const ProgramResult result = store_.run("kz7admin", words);
        EXPECT_EQ(result.exitCode, 2) << row.why;
        EXPECT_EQ(result.error, "kz7admin: " + row.told + "\n") << row.why;
    }
    const ProgramResult bad = commit("KZ7ACCOUNT = me\nwhat\n", {});
    EXPECT_EQ(bad.exitCode, 2);
    EXPECT_TRUE(bad.error.ends_with("/responses:2: there is no '=' in it\n")) << bad.error;
    EXPECT_EQ(store_.dump(), before) << "the whole file is read before anything is set";
}

TEST_F(CommitProgram, ReportsWhatTheProcessorDoes) {
    // clang-format off
    const struct { const char* why; const char* variable; const char* value; const char* log; } rows[] = {
        {"it fails",                      "KZ7_SAMPLE_EXIT", "7", "error 5030: exit code 7\nNote: The program wrote: "},
        {"it sees what was set, and writes", "KZ7_SAMPLE_HOOK", "\"$KZ7_ADMIN\" tree | grep -q KZ7ACCOUNT && \"$KZ7_TOOL\" -addKZ7Copy C2 'C:\\c2' >&2", "parameter set: DIAGLEVEL=3"},
        {"it floods its output",          "KZ7_SAMPLE_HOOK", "head -c 104857600 /dev/zero | tr '\\0' x", "parameter set: DIAGLEVEL=3"},
        {"it leaves somebody behind",     "KZ7_SAMPLE_HOOK", "f=$KZ7_STATE_DIR/pipe; mkfifo $f; (cat $f & echo late >$f &)", "parameter set: DIAGLEVEL=3"},
        {"it reads its input",            "KZ7_SAMPLE_HOOK", "cat", "parameter set: DIAGLEVEL=3"},
    };
    // clang-format on
    for (const auto& row : rows) {
        const std::string file = files_.path() + "/log";
        fs::remove(file);
        const ProgramResult result =
            commit(kGood, {"--instance", "INST", "--log", file},
                   {.environment = {std::string(row.variable) + "=" + row.value, "KZ7_ADMIN=" + programPath("kz7admin"),
                                    "KZ7_TOOL=" + programPath("kz7InstallReg")},
                    .inChild = {}});
        const std::string text = log(file);
        EXPECT_NE(text.find(row.log), std::string::npos) << row.why << "\n" << text;
        EXPECT_EQ(result.exitCode, text.find("error 5057") != std::string::npos ? 1 : 0) << row.why;
    }
    fs::remove(store_.file("drive_c/copy1/bin/kz7cmd.exe"));
    EXPECT_EQ(commit(kGood, {"--instance", "INST"}).exitCode, 1) << "it is missing";
    EXPECT_NE(log(store_.file("kz7msi.log")).find("setDBMUsingProcess, step 20: error 5082"), std::string::npos);
}

}  // namespace
}  // namespace kz7::test
