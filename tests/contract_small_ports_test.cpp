// What the implementations of the small ports must do alike, in memory and this machine's: libraries, the assembly
// cache, the clock, the line channel and the terminal.
#include <gtest/gtest.h>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class SmallPortContract : public testing::TestWithParam<const char*> {
protected:
    std::unique_ptr<Backend> backend_ = backendNamed(GetParam());
    IPlatform& platform_ = backend_->platform();
};

INSTANTIATE_TEST_SUITE_P(SmallPorts, SmallPortContract, testing::ValuesIn(kBackends));

TEST_P(SmallPortContract, LibrariesAreLoadedByTheirWholePathOnly) {
    ILibraryLoader& libraries = platform_.libraries();
    const std::string text = backend_->folder() + "\\text.dll";
    OwnedFile file(platform_.files());
    ASSERT_EQ(platform_.files().openForAppend(text, file.receive()), kSuccess);
    file.reset();
    // clang-format off
    const struct { const char* why; std::string path; Status status; } rows[] = {
        {"a library",         backend_->library(),                kSuccess},
        {"once more",         backend_->library(),                kSuccess},
        {"a missing one",     backend_->folder() + "\\absent.dll", kModuleNotFound},
        {"a missing folder",  "C:\\absent folder\\a.dll",         kModuleNotFound},
        {"a file of text",    text,                               kModuleNotFound},
        {"a bare name",       "kz7install64.dll",                 kModuleNotFound},
        {"a relative path",   "bin\\kz7install64.dll",            kModuleNotFound},
        {"nothing",           "",                                 kModuleNotFound},
    };
    // clang-format on
    for (const auto& row : rows) {
        LibraryHandle library = LibraryHandle::none;
        EXPECT_EQ(libraries.load(row.path, library), row.status) << row.why;
        EXPECT_EQ(library == LibraryHandle::none, row.status != kSuccess) << row.why;
        if (library != LibraryHandle::none) {
            EXPECT_EQ(libraries.free(library), kSuccess) << row.why;
        }
    }
}

TEST_P(SmallPortContract, EntryPointsAreGoodUntilTheLastLoadIsFreed) {
    ILibraryLoader& libraries = platform_.libraries();
    OwnedLibrary first(libraries);
    OwnedLibrary second(libraries);
    ASSERT_EQ(libraries.load(backend_->library(), first.receive()), kSuccess);
    ASSERT_EQ(libraries.load(backend_->library(), second.receive()), kSuccess);
    LibraryFunction entry = nullptr;
    EXPECT_EQ(libraries.resolve(first.get(), "sqleGetLevel", entry), kProcedureNotFound);
    EXPECT_EQ(entry, nullptr);
    first.reset();
    ASSERT_EQ(libraries.resolve(second.get(), "sqleGetLevelInfo", entry), kSuccess);
    char level[256] = {};
    EXPECT_EQ(reinterpret_cast<int (*)(std::uint32_t, char*)>(entry)(0x09010000, level), 0);
    EXPECT_STREQ(level, "KZ7 v9.1.0.0");
}

TEST_P(SmallPortContract, ProvidersComeAndGoWithTheirLevel) {
    IAssemblyCache& cache = platform_.assemblies();
    const std::string location = backend_->folder();
    EXPECT_EQ(cache.registerProviders(location, "9.1.0", kFrameworkAll), kSuccess) << "none to register";
    EXPECT_EQ(cache.registerProviders("contract", "9.1.0", kFrameworkAll), kSuccess) << "no location";
    backend_->addProvider();
    const auto records = [&] {
        OwnedKey key(platform_.registry());
        platform_.registry().openKey(KeyHandle::localMachine, "SOFTWARE\\Classes\\Installer\\Assemblies\\Global",
                                     kKeyRead, key.receive());
        FixedBuffer<1024> name;
        std::uint32_t count = 0;
        while (succeeded(platform_.registry().enumerateValue(key.get(), count, name, nullptr, nullptr))) {
            ++count;
        }
        return count;
    };
    const bool keeps = !backend_->differences().needsFramework;
    // clang-format off
    const struct { const char* why; std::string level; FrameworkGenerations added; std::uint32_t records; } rows[] = {
        {"both generations",       "9.1.0", kFrameworkAll, 2},
        {"once more",              "9.1.0", kFramework2,   2},
        {"another level",          "9.1",   kFramework4,   3},
        {"nothing of that level",  "9",     0,             3},
        {"the empty level",        "",      0,             3},
        {"one level",              "9.1.0", 0,             1},
        {"and the other",          "9.1",   0,             0},
    };
    // clang-format on
    for (const auto& row : rows) {
        const Status status = row.added != 0 ? cache.registerProviders(location, row.level, row.added)
                                             : cache.deregisterProviders(row.level);
        EXPECT_EQ(status == kSuccess, keeps || row.added == 0) << row.why << ": " << status;
        EXPECT_EQ(records(), keeps ? row.records : 0) << row.why;
    }
}

TEST_P(SmallPortContract, TheTimeIsGivenWhereItFitsWithANul) {
    FixedBuffer<64> text;
    ASSERT_EQ(platform_.clock().localTime(TimeText::dateAndZone, text), kSuccess);
    EXPECT_GT(text.view().size(), 16U) << text.view();
    EXPECT_EQ(text.view().find('\0'), std::string_view::npos);
    ASSERT_EQ(platform_.clock().localTime(TimeText::timeOfDay, text), kSuccess);
    std::string shape(text.view());
    std::replace_if(
        shape.begin(), shape.end(), [](char c) { return c >= '0' && c <= '9'; }, '0');
    EXPECT_EQ(shape, "00:00:00");
    FixedBuffer<8> eight;
    FixedBuffer<9> nine;
    EXPECT_EQ(platform_.clock().localTime(TimeText::timeOfDay, eight), kMoreData);
    EXPECT_EQ(platform_.clock().localTime(TimeText::timeOfDay, nine), kSuccess);
}

TEST_P(SmallPortContract, LinesAreReadToTheirEndAndCutToTheirRoom) {
    const struct {
        const char* why;
        std::string input;
        std::vector<std::string> lines;
    } rows[] = {
        {"both line ends, an empty line and one without an end", "one\n\ntwo\r\nend", {"one", "", "two", "end"}},
        {"what does not fit is no line of its own",
         "123456789\nnext\r\n12345678\r\n",
         {"12345678", "next", "12345678"}},
        {"a carriage return inside, a NUL, one at the end",
         std::string("a\rb\nc\0d\ne\r", 10),
         {"a\rb", {"c\0d", 3}, "e"}},
        {"nothing", "", {}},
    };
    for (const auto& row : rows) {
        backend_->reading(row.input, [&] {
            FixedBuffer<8> line;
            for (const std::string& expected : row.lines) {
                EXPECT_EQ(platform_.lines().readLine(line), kSuccess) << row.why;
                EXPECT_EQ(line.view(), expected) << row.why;
            }
            EXPECT_EQ(platform_.lines().readLine(line), kEndOfFile) << row.why;
            EXPECT_EQ(platform_.lines().readLine(line), kEndOfFile) << row.why;
        });
    }
}

TEST_P(SmallPortContract, DebugTextsReachNoStreamUnlessAskedFor) {
    const std::string both = backend_->written(true, [&](IConsole& console) {
        for (const std::string& text : {std::string("100%s %n"), std::string(100000, 'x'), std::string()}) {
            platform_.debugOutput().write(text);
        }
        console.writeOutput("a line");
    });
    EXPECT_EQ(both, "a line");
}

TEST_P(SmallPortContract, AFileIsNoTerminal) {
    TerminalView views[3];
    backend_->written(true, [&](IConsole&) {
        views[0] = platform_.terminal().look(TerminalStream::output);
        views[1] = platform_.terminal().look(TerminalStream::error);
    });
    backend_->reading("", [&] { views[2] = platform_.terminal().look(TerminalStream::input); });
    for (const TerminalView& view : views) {
        EXPECT_FALSE(view.terminal || view.redraws || view.colours);
        EXPECT_EQ(view.columns, 0U);
    }
}

}  // namespace
}  // namespace kz7::test
