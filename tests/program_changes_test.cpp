// kz7admin's commands that foretell, make and take back changes, run as a user runs them.
#include <gtest/gtest.h>
#include <sys/wait.h>

#include <filesystem>
#include <regex>
#include <set>

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

    // The native name may sort after that of the 32-bit view. A restore shows the parents that it creates.
    const std::string head = "Windows Registry Editor Version 5.00\n";
    const std::string zoo = "[HKLM\\SOFTWARE\\Zoo]\n[HKLM\\SOFTWARE\\WOW6432NODE\\Zoo]\n[-HKLM\\SOFTWARE\\NVQ]\n";
    EXPECT_TRUE(told({"import", "--diff", file("zoo.reg", head + zoo)})
                    .ends_with("\n+ HKLM\\SOFTWARE\\Zoo  (both views)\nchanged: 10 values, 11 keys\n||0"));
    const std::string named = R"("kind":"key-created","key":"HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ",)";
    EXPECT_NE(told({"restore", "--check", "--json", backup}).find(named), std::string::npos);
    EXPECT_NE(told({"restore", "--json", backup}).find(named), std::string::npos);
    expect({"import", file("no.reg", head + "[-HKLM\\SOFTWARE\\Zoo]\n[-HKLM\\SOFTWARE\\WOW6432NODE\\Zoo]\n")},
           "imported no.reg into store registry.db: 2 keys, 0 values\nchanged: 2 keys\n||0");
    expect({"diff", backup, "."}, "||0");

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

    // A restore that was killed before it moved the log goes on. Until then nothing reads the log without its store.
    ASSERT_EQ(store_.tool(kAddSecond).exitCode, 0);
    const std::string log = contents(store_.file("registry.db-wal"));
    std::filesystem::rename(store_.file("registry.db"), store_.file("registry.db.old4"));
    overwrite(store_.file("registry.db"), "The store is moved to registry.db.old4\n");
    const std::string moved = "|kz7admin: registry.db: file is not a database\n|";
    expect({"copies"}, moved + "2");
    EXPECT_EQ(store_.tool(kAddFirst).exitCode, 249);
    expect({"restore", backup},
           "! the store before is kept as registry.db.old4\nchanged: 22 values, 26 keys, 1 service\n" + moved + "0");
    EXPECT_EQ(contents(store_.file("registry.db.old4-wal")), log);
}

TEST_F(ChangesProgram, RestoreMendsADamageOfAnyPage) {
    std::string list;
    for (int copy = 0; copy < 12; ++copy) {
        list +=
            std::string(copy == 0 ? "" : ",") + R"({"name": "C)" + std::to_string(copy) + R"(", "location": "C:\\a"})";
    }
    const std::string copies = file("list.json", "{\"copies\": [" + list + "]}");
    ASSERT_EQ(store_.run("kz7admin", {"ensure", "--from", copies}).exitCode, 0);
    const std::string backup = files_.path() + "/backup";
    ASSERT_EQ(store_.run("kz7admin", {"backup", backup}).exitCode, 0);
    const std::string whole = contents(backup);
    ASSERT_GT(whole.size(), 8U * 4096);
    int unnoticed = 0;
    for (std::size_t page = 0; page < whole.size() / 4096; ++page) {
        const StateDirectory damaged;
        const std::string bytes = std::string(whole).replace(4096 * page, 4096, 4096, '\0');
        overwrite(damaged.file("registry.db"), bytes);
        // A damaged store is neither backed up over the last backup nor restored.
        const std::string last = file("last.db", whole);
        const int status = damaged.run("kz7admin", {"backup", "--force", last}).exitCode;
        EXPECT_TRUE(status == 2 ? contents(last) == whole : status == 0) << "page " << page;
        EXPECT_EQ(store_.run("kz7admin", {"restore", file("bad.db", bytes)}).exitCode, status) << "page " << page;
        expect({"diff", ".", backup}, "||0");
        // Of two at once only one replaces the store.
        const pid_t other = damaged.start({"restore", backup});
        damaged.run("kz7admin", {"restore", backup});
        waitpid(other, nullptr, 0);
        EXPECT_EQ(damaged.run("kz7admin", {"diff", damaged.path(), backup}).exitCode, 0) << "page " << page;
        EXPECT_EQ(damaged.integrity(), "ok") << "page " << page;
        const std::string kept = contents(damaged.file("registry.db.old"));
        unnoticed += kept.empty() ? 1 : 0;
        EXPECT_TRUE(kept.empty() || kept == bytes) << "page " << page;
        EXPECT_FALSE(std::filesystem::exists(damaged.file("registry.db.old2"))) << "page " << page;
    }
    EXPECT_EQ(unnoticed, 1) << "the last page of what a run changed has no structure that a zero would break";
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

TEST_F(ChangesProgram, CheckReportsRepairCorrectsAndResolveAnswers) {
    expect({"check"}, "||0");
    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);
    ASSERT_EQ(store_.tool(kAddSecond).exitCode, 0);
    store_.tool({"-dotnet", KZ7_SAMPLE});
    expect({"check"}, "||0");
    expect({"resolve", "9.7"},
           "   NAME    VERSION    LOCATION       WHY\n"
           "*  SECOND  9.7.800.0  C:\\KZ7\\second  the highest that begins with 9.7\n"
           "   FIRST   9.7.800.0  C:\\KZ7\\first   lower\n||0");
    expect({"resolve", "9", "--field", "location", "--view", "32-bit"}, "C:\\KZ7\\second\n||0");
    expect({"resolve", "8"}, "|kz7admin: alias 8 (native view): does not exist\n|1");
    ASSERT_EQ(store_.tool({"-removeKZ7Copy", "SECOND"}).exitCode, 0);
    expect({"check"}, "||0");
    EXPECT_NE(told({"check", "--all"}).find("removed-copy (deliberate): copy SECOND (32-bit view): "),
              std::string::npos);
    EXPECT_TRUE(told({"resolve", "9"})
                    .ends_with("|kz7admin: alias 9 (native view): names SECOND, which was removed; the next -dotnet "
                               "rewrites the aliases; "
                               "repair: kz7admin repair aliases\n|1"));
    expect({"copies"},
           "NAME    VIEW     VERSION    VALID  LOCATION       SERVICE\n"
           "FIRST   both     9.7.800.0  yes    C:\\KZ7\\first   KZ7MGMTSVC_FIRST stopped\n"
           "SECOND  removed  9.7.800.0  yes    C:\\KZ7\\second  none\n|kz7admin: store registry.db\n|0");

    const std::string copies = "[HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies";
    ASSERT_EQ(store_
                  .run("kz7admin",
                       {"import",
                        file("damage.reg",
                             "Windows Registry Editor Version 5.00\n" + copies + "]\n\"9.7\"=\"GONE\"\n@=\"FIRST\"\n" +
                                 copies + "\\FIRST]\n\"KZ7 Path Name\"=\"C:\\\\b\"\n" + copies +
                                 "\\x<script>]\n[HKEY_LOCAL_MACHINE\\SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_"
                                 "OLD]\n\"Start\"=dword:2\n")})
                  .exitCode,
              0);
    const std::string damaged = store_.dump();
    const std::string services =
        "service-elsewhere: service KZ7MGMTSVC_FIRST: runs C:\\KZ7\\first\\bin\\kz7mgmtsvc.exe, but its copy is at "
        "C:\\b; "
        "repair: kz7admin repair services FIRST\n"
        "orphan-service: service KZ7MGMTSVC_OLD: its copy does not exist: a removal did not end; repair: kz7admin "
        "repair "
        "services OLD\n";
    expect(
        {"check"},
        "stale-alias: alias 9.7 (native view): names GONE, which is not installed; it should name FIRST; repair: "
        "kz7admin repair aliases\n"
        "views-differ: copy FIRST: is at C:\\b (KZ7PATH C:\\KZ7\\first) for 64-bit programs and at C:\\KZ7\\first for "
        "32-bit programs; repair: kz7admin repair copies FIRST\n"
        "half-copy: copy x<script> (native view): lacks everything: an add or a removal did not end; repair: kz7admin "
        "repair copies \"x<script>\", or kz7InstallReg -removeKZ7Copy \"x<script>\"\n"
        "half-copy: copy x<script> (32-bit view): lacks everything: an add or a removal did not end; repair: kz7admin "
        "repair copies \"x<script>\", or kz7InstallReg -removeKZ7Copy \"x<script>\"\n" +
            services + "||1");
    const std::string page = store_.run("kz7admin", {"report"}).output;
    EXPECT_NE(page.find("x&lt;script&gt;"), std::string::npos);
    EXPECT_EQ(page.find("<script"), std::string::npos);
    expect({"report", "-o", file("page.html", "old")},
           "|kz7admin: cannot write report: page.html: file exists (--force replaces it)\n|2");
    const std::string facts = store_.run("kz7admin", {"facts"}).output;
    const ProgramResult fleet =
        store_.run("kz7admin", {"report", "--fleet", file("<b>.json", facts),
                                file("one.json", std::string(facts).replace(facts.find("9.7.800.0"), 1, "\\udcff")),
                                file("two.json", facts), file("none.json", "["),
                                file("some.json", R"({"schema":1,"copies":[{}],"findings":[],"programs":[]})")});
    for (const char* const part :
         {"<th scope=\"row\">&lt;b&gt;</th>", "x&lt;script&gt;", "; without usable facts: 2<br>",
          "<th scope=\"row\">one</th><td>copy FIRST is \\udcff.7.800.0 at C:\\b, most have 9.7.800.0 at C:\\b</td>"}) {
        EXPECT_NE(fleet.output.find(part), std::string::npos) << part << fleet.output;
    }
    EXPECT_EQ(fleet.output.find("<script"), std::string::npos);
    EXPECT_EQ(fleet.error + std::to_string(fleet.exitCode),
              "kz7admin: " + files_.path() + "/none.json: not what kz7admin facts writes\nkz7admin: " + files_.path() +
                  "/some.json: not what kz7admin facts writes\n1");
    expect({"report", "--fleet", "a/x.json", "x"}, "|kz7admin: two files for one machine: a/x.json and x\n|2");
    expect({"check", "NONE"}, "|kz7admin: no such copy: NONE (see kz7admin copies)\n|1");
    expect({"copies", "--default", "--columns", "name,location", "--format", "tsv", "--version", "[9.7,9.8)"},
           "FIRST\tC:\\b\n|kz7admin: store registry.db\n|0");
    const std::string removed =
        R"({"name":"SECOND","view":"32-bit","version":"9.7.800.0","location":"C:\\KZ7\\second"})"
        "\n";
    EXPECT_TRUE(
        told({"copies", "--view", "32-bit", "--valid", "--format", "jsonl", "--columns", "location,name,view,version"})
            .ends_with(removed + "||0"));
    expect({"copies", "--version", "[9.8"}, "|kz7admin: not a range of versions: [9.8 (write [9.7,9.8) or 9.7)\n|2");

    expect({"repair", "--check", "aliases"}, "would change: 8 values\n||0");
    EXPECT_EQ(store_.dump(), damaged);
    expect({"repair", "rubbish"}, "|kz7admin: neither a kind of finding nor a copy: rubbish (see kz7admin check)\n|2");
    expect({"repair", "aliases", "FIRST", "services"},
           "|kz7admin: not a kind of finding: FIRST (see kz7admin repair --help)\n|2");
    expect({"repair", "aliases", "--copy", "rubbish"},
           "|kz7admin: neither a kind of finding nor a copy: rubbish (see kz7admin check)\n|2");
    expect({"repair"}, "changed: 9 values, 1 key\n||0");
    expect({"check"}, services + "||1");
    expect({"repair", "services", "OLD"}, "changed: 1 service\n||0");
    expect({"repair", "services"}, "changed: 1 service\n||0");

    // A copy may be called like a kind.
    ASSERT_EQ(store_.tool({"-addKZ7Copy", "services", "C:\\s"}).exitCode, 0);
    EXPECT_EQ(store_
                  .run("kz7admin", {"import", file("half.reg",
                                                   "REGEDIT4\n[-HKLM\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies"
                                                   "\\services\\Components]\n")})
                  .exitCode,
              0);
    EXPECT_TRUE(told({"check"}).find("repair: kz7admin repair copies --copy=services") != std::string::npos);
    expect({"repair", "copies", "services"}, "|kz7admin: services: both a kind of finding and a copy (see --copy)\n|2");
    expect({"repair", "copies", "--copy=services"}, "changed: 2 values, 1 key\n||0");
    expect({"check"}, "||0");

    // A migration that was killed after its backup.
    const StateDirectory half;
    ASSERT_EQ(half.tool({"-v8", "C:\\8"}).exitCode, 0);
    const std::string backup = file("half.reg",
                                    "Windows Registry Editor Version 5.00\n"
                                    "[HKLM\\SOFTWARE\\NVQ\\KZ7BackupV8\\PROFILES]\n\"v\"=\"8\"\n");
    ASSERT_EQ(half.run("kz7admin", {"import", backup}).exitCode, 0);
    const auto migration = [&](Arguments words) {
        words.insert(words.begin(), {"--store", half.path(), "repair", "migration"});
        return told(words);
    };
    EXPECT_TRUE(migration({}).starts_with("! not repaired: half-migration: "));
    EXPECT_EQ(migration({"--on", KZ7_SAMPLE}), "changed: 53 values, 30 keys\n||0");
    expect({"--store", half.path(), "check"},
           "no-service: copy kz7build: the service KZ7MGMTSVC_kz7build does not exist; repair: kz7admin repair "
           "services kz7build\n||1");
    ASSERT_EQ(half.run("kz7admin", {"undo", "3"}).exitCode, 0);
    EXPECT_EQ(migration({"--back"}), "changed: 2 values, 2 keys\n||0");
}

// One row for each error line and each status of the sources.
TEST_F(ChangesProgram, ExplainsEveryErrorLineAndStatus) {
    const std::string install = KZ7_SOURCE "/install/";
    std::set<std::string> numbers;
    const auto gather = [&](const std::string& path, const std::regex& pattern) {
        const std::string text = contents(path);
        for (std::sregex_iterator match(text.begin(), text.end(), pattern), end; match != end; ++match) {
            numbers.insert((*match)[1]);
        }
    };
    gather(install + "platform/status.h", std::regex("constexpr Status k\\w+ += (\\w+);"));
    EXPECT_GT(numbers.size(), 60U);
    for (const auto& entry : std::filesystem::recursive_directory_iterator(install + "src")) {
        gather(entry.is_regular_file() ? entry.path().string() : "",
               std::regex("(?:ErrorText k\\w+ *\\{|^ +\\{)\\s*(\\d+), +\"", std::regex::multiline));
    }
    EXPECT_GT(numbers.size(), 90U);
    Arguments words = {"explain"};
    words.insert(words.end(), numbers.begin(), numbers.end());
    const ProgramResult explained = store_.run("kz7admin", words);
    EXPECT_EQ(explained.exitCode, 0) << explained.error;
    EXPECT_TRUE(
        store_.run("kz7admin", {"explain", "157"}).output.starts_with("status 5021 (seen as 157 in a POSIX shell): "));
    expect({"explain", "123456"}, "|kz7admin: neither an error line nor a status of this system: 123456\n|1");
    expect({"explain", "nonsense"},
           "|kz7admin: not a number: nonsense (give a status, an error line's number or -)\n|2");
    const std::string pasted =
        store_.shell("kz7InstallReg -v8 'C:\\8' 2>&1 | " + programPath("kz7admin") + " explain -").output;
    for (const char* const part : {"error line 1466 of -v8\n", "error line 1523 of -v8 -v9\n", "status 1060: "}) {
        EXPECT_NE(pasted.find(part), std::string::npos) << pasted;
    }
}

// Every field that a command prints is in the page about the JSON, and every field of the page is printed.
TEST_F(ChangesProgram, JsonFieldsAreThoseOfThePage) {
    store_.tool(kAddFirst);
    store_.tool({"-dotnet", KZ7_SAMPLE});
    const std::string reg =
        file("x.reg",
             "Windows Registry Editor Version "
             "5.00\n[HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\half]\n\"n\"=dword:1\n");
    const std::string list = file("list.json", R"({"copies": [{"name": "A", "location": "C:\\a"}]})");
    const std::string responses = file("r.rsp", "KZ7COMM = TCPIP\n");
    const std::string backup = files_.path() + "/backup";
    std::string printed;
    for (const Arguments& command :
         {Arguments{"backup", backup},
          {"apply", "--", "-v8", "C:\\8"},
          {"import", reg},
          {"commit", "--copy", "FIRST", "--response-file", responses, "--log", files_.path() + "/log"},
          {"ensure", "--from", list},
          {"copies"},
          {"aliases"},
          {"check", "--all"},
          {"resolve", "9"},
          {"explain", "392", "5021"},
          {"facts"},
          {"completion", "zsh"},
          {"tree", "SOFTWARE\\NVQ"},
          {"export"},
          {"report", "-o", files_.path() + "/page.html"},
          {"front", "/bin/true"},
          {"diff", backup, "."},
          {"history"},
          {"history", "show", "1"},
          {"history", "start"},
          {"history", "trim", "--keep", "1000"},
          {"repair", "--check"},
          {"restore", "--diff", backup},
          {"undo", "1"},
          {"undo", "99"},
          {"restore", "/none"},
          {"import", list},
          {"ensure", "--from", reg},
          {"copies", "--store", "/dev/null"},
          {"aliases", "77"},
          {"front", "/none"},
          {"tree", "--rubbish"}}) {
        Arguments words = command;
        words.insert(words.begin() + 1, "--json");
        const ProgramResult result = store_.run("kz7admin", words);
        const bool isTold =
            std::regex_match(result.error, std::regex("\\{\"schema\":1,\"error\":\"[^\n]*\",\"exitCode\":" +
                                                      std::to_string(result.exitCode) + "(,\"status\":\\d+)?\\}\n"));
        EXPECT_EQ(isTold, !result.error.empty()) << command[0] << result.error;
        EXPECT_TRUE(result.output.empty() ? isTold && result.exitCode != 0
                                          : result.output.starts_with("{\"schema\":1,") && result.exitCode < 2)
            << command[0] << result.output << result.error;
        printed += result.output + result.error;
    }
    const auto names = [](const std::string& text, const std::regex& pattern) {
        std::set<std::string> found;
        for (std::sregex_iterator match(text.begin(), text.end(), pattern), end; match != end; ++match) {
            found.insert((*match)[1]);
        }
        return found;
    };
    std::string page;
    for (const std::string& cell :
         names(contents(KZ7_SOURCE "/docs/json.md"), std::regex("^\\| (`[^|]*`) \\|", std::regex::multiline))) {
        page += cell;
    }
    EXPECT_EQ(names(printed, std::regex("[{,\n]\"([A-Za-z0-9]+)\":")), names(page, std::regex("`(\\w+)`")));
}

TEST_F(ChangesProgram, TakeRunsBackAndDoThemAgain) {
    const auto state = [&] { return store_.run("kz7admin", {"export"}).output; };
    expect({"history"}, "|kz7admin: no run is recorded: registry.db\n|1");
    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);
    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);  // changes nothing
    const std::string first = state();
    ASSERT_EQ(store_.tool({"-v9", KZ7_SAMPLE}).exitCode, 0);
    const std::string second = state();
    expect({"undo", "1"},
           "! HKLM\\SYSTEM\\CurrentControlSet\\Services\\EventLog\\Application\\KZ7 Management Service "
           "\"EventMessageFile\"\n! HKLM\\SYSTEM\\CurrentControlSet\\Services\n"
           "! HKLM\\SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\n"
           "! HKLM\\SOFTWARE\\NVQ\\KZ7\\InstalledCopies\n! HKLM\\SOFTWARE\\NVQ\nunchanged\n"
           "|kz7admin: cannot take back run 1: its rows were changed since\n|1");
    EXPECT_EQ(state(), second);
    expect({"diff", "--stat", "@2", "."}, "differ: 45 values, 20 keys, 1 service\n||1");
    EXPECT_TRUE(told({"undo", "2", "--check"}).ends_with("would change: 45 values, 20 keys, 1 service\n||0"));
    EXPECT_EQ(state(), second);
    EXPECT_TRUE(told({"undo", "2"}).starts_with("! not taken back: ran \"" KZ7_SAMPLE));
    EXPECT_EQ(state(), first);
    EXPECT_TRUE(told({"undo", "2"}).ends_with("unchanged\n|kz7admin: cannot take back run 2: run 3 took it back\n|1"));
    EXPECT_EQ(store_.run("kz7admin", {"undo", "3"}).exitCode, 0);
    EXPECT_EQ(state(), second);
    expect({"diff", "@3", "."}, "||0");
    expect({"undo", "9"}, "|kz7admin: no such run: 9 (see kz7admin history)\n|1");
    expect({"history", "trim", "--keep", "1", "--check"}, "would remove: 3 runs\n||0");
    expect({"history", "trim", "--keep", "1"}, "removed: 3 runs\n||0");
    expect({"diff", "@3", "."}, "|kz7admin: no such run: 3 (see kz7admin history)\n|1");
    ASSERT_EQ(store_.tool({"-removeKZ7Copy", "FIRST"}).exitCode, 0);
    EXPECT_NE(told({"history", "FIRST"}).find("5    "), std::string::npos);

    // What a run changed, made elsewhere.
    const StateDirectory other;
    const std::string reg = file("run5.reg", store_.run("kz7admin", {"history", "show", "5", "--reg"}).output);
    ASSERT_EQ(store_.run("kz7admin", {"undo", "5"}).exitCode, 0);
    other.copyFrom(store_);
    ASSERT_EQ(store_.run("kz7admin", {"undo", "6"}).exitCode, 0);
    EXPECT_EQ(other.run("kz7admin", {"import", reg}).exitCode, 0);
    expect({"diff", ".", other.path()}, "||0");

    // The key of a user that the first write made goes, too.
    const StateDirectory empty;
    const std::string own = file("own.reg", "REGEDIT4\n\n[HKEY_CURRENT_USER]\n\"a\"=\"1\"\n\n[HKEY_CURRENT_USER\\Q]\n");
    EXPECT_EQ(empty.run("kz7admin", {"import", own}).exitCode, 0);
    EXPECT_EQ(empty.run("kz7admin", {"undo", "1"}).exitCode, 0);
    EXPECT_EQ(empty.run("kz7admin", {"export"}).exitCode, 1);

    expect({"history", "trim", "--before", "2001-01-01"}, "unchanged\n||0");
    expect({"history", "trim", "--before", "2999-01-01T00:00:00Z"}, "removed: 4 runs\n||0");
    expect({"history"}, "|kz7admin: no run is recorded: registry.db\n|1");
}

// Programs that a run starts see it in progress and cannot trim it, and their own runs name it.
TEST_F(ChangesProgram, RunsOfARunAreTakenBackOnTheirOwn) {
    const auto state = [&] { return store_.run("kz7admin", {"export"}).output; };
    ASSERT_EQ(store_.tool(kAddFirst).exitCode, 0);
    const std::string first = state();
    const std::string seen = files_.path() + "/seen";
    const std::string child = files_.path() + "/child";
    const std::string hook = "KZ7_SAMPLE_HOOK=" + programPath("kz7admin") + " undo 2 2>" + seen + "; " +
                             programPath("kz7admin") + " history trim --keep 0 >" + seen + ".out; [ -e " + child +
                             " ] || " + programPath("kz7InstallReg") + " -addKZ7Copy CHILD 'C:\\child' >" + child;
    ASSERT_EQ(store_.tool({"-v9", KZ7_SAMPLE}, {{hook}, {}}).exitCode, 0);
    EXPECT_EQ(contents(seen), "kz7admin: run 2 is in progress\n");
    EXPECT_NE(told({"history", "show", "3"}).find("\nstarted by run 2\n"), std::string::npos);
    // A service that runs goes as well.
    const std::string service = "HKEY_LOCAL_MACHINE\\SYSTEM\\CurrentControlSet\\Services\\KZ7MGMTSVC_CHILD";
    const std::string running = "REGEDIT4\n[" + service + "]\n\"CurrentState\"=dword:4\n";
    ASSERT_EQ(store_.run("kz7admin", {"import", file("running.reg", running)}).exitCode, 0);
    EXPECT_EQ(store_.run("kz7admin", {"undo", "3"}).exitCode, 0);
    EXPECT_NE(told({"undo", "2"}).find("not taken back: run 3, kz7InstallReg"), std::string::npos);
    EXPECT_EQ(state(), first);
}

TEST_F(ChangesProgram, BadInputIsOneLineAndChangesNothing) {
    const std::string copy = R"({"copies": [{"name": "A", "location": "C:\\a"}, )";
    const std::pair<std::string, std::string> rows[] = {
        {"{\n", "line 2: not valid JSON"},
        {"{\"copies\": [{\"name\": \"\xFF\"}]}", "line 1: not valid JSON"},
        {"[]", "document: is not an object"},
        {"{}", "copies: is missing"},
        {R"({"copies": 1})", "copies: is not an array"},
        {R"({"copies": [], "$schema": 5})", "$schema: is not a string"},
        {R"({"copies": [], "copies": []})", "copies: is twice in one object"},
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
    expect({"diff", ".", ".", "HKLM\\NONE"}, "|kz7admin: no such key: HKEY_LOCAL_MACHINE\\NONE\n|2");
    expect({"restore", file("empty.reg", "Windows Registry Editor Version 5.00\n")},
           "|kz7admin: nothing to restore: empty.reg\n|2");
    const std::string key = "HKEY_LOCAL_MACHINE\\SOFTWARE\\NVQ\\KZ7";
    expect({"restore", file("part.reg", "REGEDIT4\n[" + key + "\\InstalledCopies\\A]\n")},
           "|kz7admin: part.reg: only a part of " + key + ": kz7admin import takes it\n|2");
    expect({"restore", file("cut.reg", "REGEDIT4\n[" + key + "]\n\"a\"=dword:00")},
           "|kz7admin: cut.reg: the last line has no end: the file was cut off\n|2");
    expect({"restore", file("changes.reg", "REGEDIT4\n[-" + key + "]\n")},
           "|kz7admin: changes.reg: removes keys or values, as no export does: kz7admin import takes it\n|2");
    for (const auto& words : {Arguments{"undo", "1"},
                              {"undo", "-1"},
                              {"history", "trim", "--before", "2026-31-01"},
                              {"repair"},
                              {"history", "trim", "--keep", "1"}}) {
        EXPECT_EQ(store_.run("kz7admin", words).exitCode, 2) << words.front();
    }
    expect({"apply", "--", "-addKZ7Copy", "A"},
           "|kz7admin: not a command of kz7InstallReg: -addKZ7Copy A (see kz7admin apply --help)\n|2");
    EXPECT_EQ(store_.dump(), "");
}

}  // namespace
}  // namespace kz7::test
