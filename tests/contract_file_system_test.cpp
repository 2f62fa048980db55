// The contract of the file-system port, for the one in memory and this machine's.
#include <gtest/gtest.h>

#include <algorithm>
#include <optional>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class FileSystemContract : public Contract {
protected:
    IFileSystem& files_ = platform_.files();
    std::string folder_ = backend_->folder() + "\\";
};

INSTANTIATE_TEST_SUITE_P(FileSystems, FileSystemContract, testing::ValuesIn(kBackends));

TEST_P(FileSystemContract, DistinguishesFilesFromOtherPaths) {
    std::string slashes = backend_->program();
    std::replace(slashes.begin(), slashes.end(), '\\', '/');
    // clang-format off
    const struct { const char* why; std::string path; Status probed; std::optional<Status> opened; Status read; } rows[] = {
        {"a file",                       backend_->program(),              kSuccess,      {},            kSuccess},
        {"a folder",                     backend_->folder(),               kSuccess,      kAccessDenied, kAccessDenied},
        {"a folder with a separator",    folder_,                          kSuccess,      {},            {}},
        {"the other separators",         slashes,                          kSuccess,      {},            {}},
        {"a doubled separator",          folder_ + "\\Program.exe",        kSuccess,      {},            {}},
        {"a missing file",               folder_ + "absent.exe",           kFileNotFound, {},            {}},
        {"a missing folder",             "C:\\absent folder\\program.exe", kFileNotFound, kPathNotFound, kFileNotFound},
        {"a drive that is not there",    "Q:\\program.exe",                kFileNotFound, {},            {}},
        {"nothing",                      "",                               kFileNotFound, kFileNotFound, kFileNotFound},
        {"a NUL",                        backend_->folder() + '\0',        kFileNotFound, {},            {}},
        {"relative",                     "tests",                          kFileNotFound, kFileNotFound, kFileNotFound},
        {"relative to a drive",          "C:windows",                      kFileNotFound, {},            {}},
        {"relative to the folder above", "..\\tests",                      kFileNotFound, {},            {}},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(files_.probe(row.path), row.probed) << row.why << ": " << row.path;
        if (row.opened) {
            OwnedFile file(files_);
            std::string content;
            EXPECT_EQ(files_.openForAppend(row.path, file.receive()), row.opened) << row.why;
            EXPECT_FALSE(file) << row.why;
            EXPECT_EQ(files_.readFile(row.path, content), row.read) << row.why;
        }
    }
}

TEST_P(FileSystemContract, FilesAreAppendedToAndReadWhole) {
    const std::string path = folder_ + "run.log";
    OwnedFile file(files_);
    OwnedFile second(files_);
    std::string content = "untouched";
    EXPECT_EQ(files_.readFile(path, content), kFileNotFound);
    EXPECT_EQ(content, "untouched");
    ASSERT_EQ(files_.openForAppend(path, file.receive()), kSuccess);
    EXPECT_EQ(files_.probe(path), kSuccess) << "made by the opening";
    ASSERT_EQ(files_.openForAppend(path, second.receive()), kSuccess);
    std::string all;
    // Each writes after the other's bytes.
    for (const std::string& bytes :
         {std::string("one\r\n\0\xFF\n", 8), std::string(200'000, 'x'), std::string("end"), std::string()}) {
        std::uint32_t written = 77;
        EXPECT_EQ(files_.write(all.size() == 8 ? second.get() : file.get(), bytes, written), kSuccess);
        EXPECT_EQ(written, bytes.size());
        all += bytes;
    }
    EXPECT_EQ(files_.readFile(path, content), kSuccess) << "while it is open";
    EXPECT_TRUE(content == all) << content.size() << " bytes";

    std::uint32_t written = 0;
    const FileHandle closed = second.get();
    second.reset();
    EXPECT_EQ(files_.write(closed, "lost", written), kInvalidHandle);
    EXPECT_EQ(files_.closeFile(closed), kInvalidHandle);
    ASSERT_EQ(files_.openForAppend(path, second.receive()), kSuccess);
    if (!backend_->differences().usesHandlesAgain) {
        EXPECT_EQ(files_.write(closed, "lost", written), kInvalidHandle) << "after another opening";
    }
    EXPECT_EQ(files_.closeFile(FileHandle::none), kInvalidHandle);
}

TEST_P(FileSystemContract, WholeFilesAreWrittenAndReplaced) {
    const std::string path = folder_ + "whole";
    // clang-format off
    const struct { const char* why; std::string path; std::string content; bool replace; Status status; } rows[] = {
        {"a new file",        path,                    std::string(100'000, 'x'), false, kSuccess},
        {"an existing file",  path,                    "lost",                    false, kFileExists},
        {"its replacement",   path,                    "new\n",                  true,  kSuccess},
        {"a folder",          backend_->folder(),      "lost",                    true,  kBadPathname},
        {"no name",           folder_,                 "lost",                    true,  kBadPathname},
        {"a missing folder",  folder_ + "none\\file", "lost",                    false, kPathNotFound},
        {"relative",          "whole",                 "lost",                    false, kBadPathname},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(files_.writeFile(row.path, row.content, row.replace), row.status) << row.why;
        std::string content;
        EXPECT_EQ(files_.readFile(path, content), kSuccess);
        EXPECT_NE(content, "lost") << row.why;
        EXPECT_EQ(content == row.content, row.status == kSuccess) << row.why;
    }
}

TEST_P(FileSystemContract, TheFirstFileThatFitsAPatternIsFound) {
    for (const char* name : {"text_b.cat", "text_A.cat", "text.cat", "text_aa.cat"}) {
        OwnedFile file(files_);
        ASSERT_EQ(files_.openForAppend(folder_ + name, file.receive()), kSuccess);
    }
    // clang-format off
    const struct { const char* why; std::string pattern; const char* name; } rows[] = {
        {"any one character", folder_ + "text_?.cat",        "text_A.cat"},
        {"and two of them",   folder_ + "text_??.cat",       "text_aa.cat"},
        {"case",              folder_ + "TEXT_B.CAT",        "text_b.cat"},
        {"no character less", folder_ + "text.cat?",         ""},
        {"only at its begin", folder_ + "ext_?.cat",         ""},
        {"no such folder",    folder_ + "absent\\text?.cat", ""},
        {"relative",          "CMakeLists.tx?",              ""},
    };
    // clang-format on
    for (const auto& row : rows) {
        std::string name;
        EXPECT_EQ(findFile(files_, row.pattern, name), *row.name != '\0' ? kSuccess : kFileNotFound) << row.why;
        EXPECT_EQ(name, row.name) << row.why;
    }
}

}  // namespace
}  // namespace kz7::test
