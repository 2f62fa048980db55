// What every file system must answer alike: the one in memory and this machine's.
#include <gtest/gtest.h>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class FileSystemContract : public testing::TestWithParam<const char*> {};

INSTANTIATE_TEST_SUITE_P(FileSystems, FileSystemContract, testing::ValuesIn(kBackends));

TEST_P(FileSystemContract, TellsWhatIsThere) {
    const std::unique_ptr<Backend> backend = backendNamed(GetParam());
    std::string slashes = backend->program();
    for (char& c : slashes) {
        c = c == '\\' ? '/' : c;
    }
    std::string doubled = backend->program();
    doubled.insert(doubled.rfind('\\'), "\\");
    // clang-format off
    const struct { const char* why; std::string path; Status status; } rows[] = {
        {"a file",                       backend->program(),                 kSuccess},
        {"a folder",                     backend->folder(),                  kSuccess},
        {"a folder with a separator",    backend->folder() + "\\",           kSuccess},
        {"the other separators",         slashes,                            kSuccess},
        {"a doubled separator",          doubled,                            kSuccess},
        {"a missing file",               backend->folder() + "\\absent.exe", kFileNotFound},
        {"a missing folder",             "C:\\absent folder\\program.exe",   kFileNotFound},
        {"a drive that is not there",    "Q:\\program.exe",                  kFileNotFound},
        {"nothing",                      "",                                 kFileNotFound},
        {"a NUL",                        backend->folder() + '\0',           kFileNotFound},
        {"relative",                     "tests",                            kFileNotFound},
        {"relative with a folder",       "tests\\support",                   kFileNotFound},
        {"relative to a drive",          "C:windows",                        kFileNotFound},
        {"relative to the folder above", "..\\tests",                        kFileNotFound},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(backend->platform().files().probe(row.path), row.status) << row.why << ": " << row.path;
    }
}

TEST_P(FileSystemContract, WritesAtTheEndAndReadsBack) {
    const std::unique_ptr<Backend> backend = backendNamed(GetParam());
    IFileSystem& files = backend->platform().files();
    const std::string path = backend->folder() + "\\written.log";
    std::string content = "kept";
    EXPECT_EQ(files.readFile(path, content), kFileNotFound);
    EXPECT_EQ(content, "kept");
    const std::string large(200'000, 'x');
    for (const std::string_view text :
         {std::string_view("one\n"), std::string_view("\0\r\n", 3), std::string_view(large)}) {
        OwnedFile file(files);
        ASSERT_EQ(files.openForAppend(path, file.receive()), kSuccess);
        std::uint32_t written = 0;
        EXPECT_EQ(files.write(file.get(), text, written), kSuccess);
        EXPECT_EQ(written, text.size());
    }
    EXPECT_EQ(files.readFile(path, content), kSuccess);
    EXPECT_EQ(content, std::string("one\n\0\r\n", 7) + large);

    // clang-format off
    const struct { const char* why; std::string path; Status status; } rows[] = {
        {"a folder that is missing", backend->folder() + "\\absent\\x.log", kPathNotFound},
        {"a folder",                 backend->folder(),                     kAccessDenied},
        {"relative",                 "x.log",                               kFileNotFound},
        {"nothing",                  "",                                    kFileNotFound},
    };
    // clang-format on
    for (const auto& row : rows) {
        FileHandle file = FileHandle::none;
        EXPECT_EQ(files.openForAppend(row.path, file), row.status) << row.why;
        EXPECT_EQ(file, FileHandle::none) << row.why;
    }
    EXPECT_EQ(files.closeFile(FileHandle::none), kInvalidHandle);
}

TEST_P(FileSystemContract, FindsTheFirstFileThatFits) {
    const std::unique_ptr<Backend> backend = backendNamed(GetParam());
    IFileSystem& files = backend->platform().files();
    for (const char* name :
         {"installSAM.0002.log", "installSAM.0001.log", "installSAM.01.log", "uninstallSAM.0001.log"}) {
        OwnedFile file(files);
        ASSERT_EQ(files.openForAppend(backend->folder() + "\\" + name, file.receive()), kSuccess);
    }
    // clang-format off
    const struct { const char* pattern; const char* name; } rows[] = {
        {"installSAM.????.log",   "installSAM.0001.log"},
        {"installSAM.???2.log",   "installSAM.0002.log"},
        {"INSTALLsam.????.LOG",   "installSAM.0001.log"},
        {"installSAM.??.log",     "installSAM.01.log"},
        {"installSAM.???.log",    ""},
        {"uninstallSAM.????.log", "uninstallSAM.0001.log"},
    };
    // clang-format on
    for (const auto& row : rows) {
        std::string name;
        const Status status = files.findFile(backend->folder() + "\\" + row.pattern, name);
        EXPECT_EQ(status, *row.name != '\0' ? kSuccess : kFileNotFound) << row.pattern;
        EXPECT_EQ(name, row.name) << row.pattern;
    }
    std::string name;
    EXPECT_EQ(files.findFile(backend->folder() + "\\absent\\x", name), kFileNotFound);
}

}  // namespace
}  // namespace kz7::test
