// kz7admin's commands that foretell, make and take back changes, run as a user runs them.
#include <gtest/gtest.h>

#include <filesystem>

#include "tests/support/state_directory.h"

namespace kz7::test {
namespace {

class ChangesProgram : public testing::Test {
protected:
    // "output|error|exit code" with the store's and the files' folders left out.
    std::string told(const Arguments& arguments) const {
        const ProgramResult result = store_.run("kz7admin", arguments);
        std::string text = result.output + "|" + result.error + "|" + std::to_string(result.exitCode);
        for (const std::string& folder : {store_.path() + "/", files_.path() + "/"}) {
            for (std::size_t at = 0; (at = text.find(folder, at)) != std::string::npos;) {
                text.erase(at, folder.size());
            }
        }
        return text;
    }
    void expect(const Arguments& arguments, const std::string& wanted) const { EXPECT_EQ(told(arguments), wanted); }
    std::string file(const std::string& name, const std::string& bytes) const {
        overwrite(files_.path() + "/" + name, bytes);
        return files_.path() + "/" + name;
    }

    StateDirectory store_;
    TemporaryDirectory files_;
};

TEST_F(ChangesProgram, ForetellMakeAndTakeBack) {
    const StateDirectory missing;
    expect({"--store", missing.path() + "/none", "apply", "--check", "--", "-addKZ7Copy", "A", "C:\\a"},
           "would change: 22 values, 26 keys, 1 service\n||0");
    EXPECT_FALSE(std::filesystem::exists(missing.path() + "/none")) << "check mode touches nothing";

    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);
    const std::string backup = files_.path() + "/backup";
    ASSERT_EQ(store_.run("kz7admin", {"backup", backup}).exitCode, 0);
    const std::string before = store_.dump();
    const std::string moved =
        "~ HKLM\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\FIRST \"KZ7 Path Name\"  \"C:\\KZ7\\first\" -> \"C:\\b\"  (both "
        "views)\n"
        "~ HKLM\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\FIRST\\GLOBAL_PROFILE \"KZ7PATH\"  \"C:\\KZ7\\first\" -> "
        "\"C:\\b\"  (both views)\n"
        "! service KZ7MGMTSVC_FIRST stays at C:\\KZ7\\first\\bin\\kz7mgmtsvc.exe\n";
    expect({"apply", "--check", "--diff", "--detailed-exitcode", "--", "-addKZ7Copy", "first", "C:\\b"},
           moved + "would change: 4 values\n||3");
    EXPECT_EQ(store_.dump(), before);
    expect({"apply", "--check", "--", "-dotnet", "C:\\none"},
           "> would run \"C:\\none\\bin\\kz7nmpcfg.exe\" -register -level  -kz7path C:\\none\n"
           "> would run \"C:\\none\\bin\\kz7nmpcfg_32.exe\" -register -level  -kz7path C:\\none -migratev8 \n"
           "would change: 8 values\n"
           "|install\\src\\uselvlkz7reg.cpp:601: Unable to load C:\\none\\bin\\kz7install64.dll\n"
           "install\\src\\uselvlkz7reg.cpp:607: Unable to retrieve the version of the sqllib\n|1");
    EXPECT_TRUE(
        told({"apply", "--diff", "--", "-addKZ7Copy", "first", "C:\\b"}).ends_with(moved + "changed: 4 values\n||0"));
    expect({"diff", "--stat", backup, "."}, "differ: 4 values\n||1");
    expect({"restore", "--check", backup}, "would change: 4 values\n||0");
    expect({"restore", backup}, "changed: 4 values\n||0");
    EXPECT_EQ(store_.dump(), before);
    expect({"restore", "--detailed-exitcode", backup}, "unchanged\n||0");
    expect({"diff", store_.path(), backup}, "||0");

    // What `diff --reg` writes makes one registry of the other.
    ASSERT_EQ(store_.tool({"-v9", KZ7_SAMPLE}).exitCode, 0);
    const std::string reg = file("steps.reg", store_.run("kz7admin", {"diff", "--reg", ".", backup}).output);
    EXPECT_EQ(store_.run("kz7admin", {"import", reg}).exitCode, 0);
    expect({"diff", backup, "."}, "||0");
}

TEST_F(ChangesProgram, RestoreReplacesAStoreThatIsMissingOrDamaged) {
    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);
    const std::string backup = files_.path() + "/backup";
    ASSERT_EQ(store_.run("kz7admin", {"backup", backup}).exitCode, 0);
    const std::string bytes = std::string(20000, '?');

    overwrite(store_.file("registry.db"), bytes);
    const std::string damage = "|kz7admin: registry.db: file is not a database\n|0";
    expect({"restore", "--check", backup}, "would change: 22 values, 26 keys, 1 service\n" + damage);
    EXPECT_EQ(contents(store_.file("registry.db")), bytes);
    expect({"restore", backup},
           "! the store before is kept as registry.db.old\nchanged: 22 values, 26 keys, 1 service\n" + damage);
    expect({"diff", ".", backup}, "||0");
    EXPECT_EQ(contents(store_.file("registry.db.old")), bytes);

    // The log of a store that is gone is not applied to the next one.
    ASSERT_EQ(store_.tool(kAddSecond).exitCode, 0);
    std::filesystem::remove(store_.file("registry.db"));
    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);
    expect({"diff", ".", backup}, "||0");
    std::filesystem::remove(store_.file("registry.db"));
    expect({"restore", backup},
           "! the store before is kept as registry.db.old3\n"
           "changed: 22 values, 26 keys, 1 service\n||0");
    expect({"diff", ".", backup}, "||0");
}

TEST_F(ChangesProgram, EnsureMakesTheCopiesOfAList) {
    const auto list = [&](const std::string& copies) { return file("list.json", "{\"copies\": [" + copies + "]}"); };
    const std::string a = R"({"name": "A", "location": "C:\\a"})";
    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);
    expect({"ensure", "--check", "--from", list(a + R"(,{"name": "GONE", "state": "absent"})")},
           "would change: 21 values, 12 keys, 1 service\n||0");
    expect({"ensure", "--from", list(a)}, "changed: 21 values, 12 keys, 1 service\n||0");
    expect({"ensure", "--from", list(a), "--detailed-exitcode"}, "unchanged\n||0");
    expect({"ensure", "--from", list(a), "--prune"}, "changed: 10 values, 6 keys, 1 service\n||0");
    EXPECT_EQ(
        told({"ensure", "--from", list(R"({"name": "a", "location": "C:\\moved"})")}),
        "! service KZ7MGMTSVC_a stays at C:\\a\\bin\\kz7mgmtsvc.exe (--services corrects it)\nchanged: 4 values\n||0");
    expect({"ensure", "--services", "--from", list(R"({"name": "a", "location": "C:\\moved"})")},
           "changed: 1 service\n||0");
    expect({"ensure", "--prune", "--from", list("")},
           "|kz7admin: cannot remove A: the last copy takes the whole product along (--prune --all removes it)\n|2");
    EXPECT_EQ(store_.run("kz7admin", {"ensure", "--prune", "--all", "--from", list("")}).exitCode, 0);
    EXPECT_EQ(told({"copies"}).find("native"), std::string::npos);
}

TEST_F(ChangesProgram, BadInputIsOneLineAndChangesNothing) {
    const std::string copy = R"({"copies": [{"name": "A", "location": "C:\\a"}, )";
    const std::pair<std::string, std::string> rows[] = {
        {"{\n", "line 2: not valid JSON"},
        {"{\"copies\": [{\"name\": \"\xFF\"}]}", "line 1: not valid JSON"},
        {"[]", "document: is not an object"},
        {"{}", "copies: is missing"},
        {R"({"copies": 1})", "copies: is not an array"},
        {R"({"copies": [], "more": 1})", "more: is an unknown field"},
        {copy + "1]}", "copies[1]: is not an object"},
        {copy + R"({"name": "B", "path": "x"}]})", "copies[1].path: is an unknown field"},
        {copy + R"({"name": "B"}]})", "copies[1].location: is missing"},
        {copy + R"({"location": "x"}]})", "copies[1].name: is missing"},
        {copy + R"({"name": 1}]})", "copies[1].name: is not a string"},
        {copy + R"({"name": "a", "state": "absent"}]})", "copies[1].name: is in the list twice"},
        {copy + R"({"name": "x\\y", "location": "x"}]})", "copies[1].name: is not a valid copy name"},
        {copy + R"({"name": "kz7v8", "location": "x"}]})", "copies[1].name: stands for a version-8 installation"},
        {copy + R"({"name": "B", "state": "gone"}]})", "copies[1].state: is neither \"present\" nor \"absent\""},
        {copy + R"({"name": "B", "location": ""}]})", "copies[1].location: is empty"},
        {copy + "{\"name\": \"" + std::string(65, 'n') + "\"}]}", "copies[1].name: is longer than 64 characters"},
    };
    for (const auto& [text, reason] : rows) {
        expect({"ensure", "--from", file("list.json", text)}, "|kz7admin: list.json: " + reason + "\n|2");
    }
    expect({"diff", ".", files_.path() + "/none"}, "|kz7admin: none: No such file or directory\n|2");
    expect({"diff", ".", "/usr"}, "|kz7admin: no store: /usr\n|2");
    expect({"restore", file("empty.reg", "Windows Registry Editor Version 5.00\n")},
           "|kz7admin: nothing to restore: empty.reg\n|2");
    expect({"apply", "--", "-addKZ7Copy", "A"},
           "|kz7admin: not a command of kz7InstallReg: -addKZ7Copy A (see kz7admin apply --help)\n|2");
    EXPECT_EQ(store_.dump(), "");
}

}  // namespace
}  // namespace kz7::test
