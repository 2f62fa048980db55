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

}  // namespace
}  // namespace kz7::test
