// The contracts of the small ports, in memory and of this machine: console and debug output, libraries, the assembly
// cache, the clock, the line channel and the terminal.
#include <gtest/gtest.h>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

using namespace std::literals;

using SmallPortContract = Contract;

INSTANTIATE_TEST_SUITE_P(SmallPorts, SmallPortContract, testing::ValuesIn(kBackends));

TEST_P(SmallPortContract, WritesWholeTextsInOrderAndNoDebugTexts) {
    const std::string text = "100%s %n\n" + std::string(100'000, 'x') + "\xE9\n\nno line feed at the end";
    EXPECT_EQ(backend_->written([&](IConsole& console) {
        EXPECT_EQ(console.writeOutput(text), kSuccess);
        EXPECT_EQ(console.writeError(" error"), kSuccess);
        platform_.debugOutput().write(text);
        platform_.debugOutput().write("");
        EXPECT_EQ(console.writeOutput(""), kSuccess);
        EXPECT_EQ(console.writeOutput(" more"), kSuccess);
        EXPECT_EQ(console.writeOutput(" and more"), kSuccess);
        EXPECT_EQ(console.writeError(""), kSuccess);
        EXPECT_EQ(console.writeError(" last"), kSuccess);
        EXPECT_EQ(console.flush(), kSuccess);
    }),
              text + " error more and more last");
}

TEST_P(SmallPortContract, LibrariesAreLoadedByAbsolutePathsOnly) {
    ILibraryLoader& libraries = platform_.libraries();
    const std::string text = backend_->folder() + "\\text.dll";
    OwnedFile file(platform_.files());
    ASSERT_EQ(platform_.files().openForAppend(text, file.receive()), kSuccess);
    file.reset();
    for (const std::string& path :
         {backend_->folder() + "\\absent.dll", std::string("C:\\absent folder\\a.dll"), text,
          std::string("kz7install64.dll"), std::string("bin\\kz7install64.dll"), std::string()}) {
        LibraryHandle library = LibraryHandle::none;
        EXPECT_EQ(libraries.load(path, library), kModuleNotFound) << path;
        EXPECT_EQ(library, LibraryHandle::none) << path;
    }
    OwnedLibrary first(libraries);
    OwnedLibrary second(libraries);
    ASSERT_EQ(libraries.load(backend_->library(), first.receive()), kSuccess);
    ASSERT_EQ(libraries.load(backend_->library(), second.receive()), kSuccess);
    LibraryFunction entry = nullptr;
    EXPECT_EQ(libraries.resolve(first.get(), "sqleGetLevel", entry), kProcedureNotFound);
    EXPECT_EQ(entry, nullptr);
    first.reset();
    ASSERT_EQ(libraries.resolve(second.get(), "sqleGetLevelInfo", entry), kSuccess) << "good until the last is freed";
    char level[256] = {};
    EXPECT_EQ(reinterpret_cast<int (*)(std::uint32_t, char*)>(entry)(0x09010000, level), 0);
    EXPECT_STREQ(level, "KZ7 v9.1.0.0");
}

TEST_P(SmallPortContract, ProvidersAreRegisteredByLevel) {
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
    };
    // clang-format on
    for (const auto& row : rows) {
        const Status status = row.added != 0 ? cache.registerProviders(location, row.level, row.added)
                                             : cache.deregisterProviders(row.level);
        EXPECT_EQ(status == kSuccess, keeps || row.added == 0) << row.why << ": " << status;
        EXPECT_EQ(records(), keeps ? row.records : 0) << row.why;
    }
}

TEST_P(SmallPortContract, TheTimeMustFitWithItsTerminator) {
    FixedBuffer<64> text;
    FixedBuffer<8> eight;
    FixedBuffer<9> nine;
    ASSERT_EQ(platform_.host().localTime(TimeText::dateAndZone, text), kSuccess);
    EXPECT_GT(text.text().size(), 16U) << text.view();
    EXPECT_EQ(platform_.host().localTime(TimeText::timeOfDay, eight), kMoreData);
    ASSERT_EQ(platform_.host().localTime(TimeText::timeOfDay, nine), kSuccess);
    std::string shape(nine.view());
    std::replace_if(
        shape.begin(), shape.end(), [](char c) { return c >= '0' && c <= '9'; }, '0');
    EXPECT_EQ(shape, "00:00:00");
}

TEST_P(SmallPortContract, LinesAreReadWholeAndCutToTheBuffer) {
    FixedBuffer<8> line;
    // Both line ends and none; a line that does not fit is cut and the next line follows; a carriage return inside and
    // at the end; a NUL.
    backend_->reading("one\n\ntwo\r\n123456789\nnext\r\n12345678\r\na\rb\nc\0d\ne\r"s, [&] {
        std::string lines;
        while (platform_.terminal().readLine(line) == kSuccess) {
            lines.append(line.view()) += '|';
        }
        EXPECT_EQ(lines, "one||two|12345678|next|12345678|a\rb|c\0d|e|"s);
        EXPECT_EQ(platform_.terminal().readLine(line), kEndOfFile);
    });
}

}  // namespace
}  // namespace kz7::test
