#include "install/src/registry/copy_name.h"

#include <gtest/gtest.h>

namespace kz7 {
namespace {

TEST(CopyName, Substitution) {
    // clang-format off
    const struct { const char* why; const char* text; const char* name; const char* result; } rows[] = {
        {"every occurrence",                 "A\\$CurrentInstallationName$-$CurrentInstallationName$", "X", "A\\X-X"},
        {"the other token where the first is missing", "$DefaultInstallationName$",                    "X", "X"},
        {"only one of the two",              "$DefaultInstallationName$$CurrentInstallationName$", "X", "$DefaultInstallationName$X"},
        {"what is inserted is not searched", "$CurrentInstallationName$", "a$CurrentInstallationName$b", "a$CurrentInstallationName$b"},
        {"an empty name leaves the text",    "A\\$CurrentInstallationName$", "", "A\\$CurrentInstallationName$"},
        {"case counts",                      "$currentinstallationname$",   "X", "$currentinstallationname$"},
    };
    // clang-format on
    for (const auto& row : rows) {
        EXPECT_EQ(substituteCopyName(row.text, row.name), row.result) << row.why;
    }
}

TEST(CopyName, ResultGoesWhereTheCallerSays) {
    const char* const text = "$CurrentInstallationName$";
    EXPECT_EQ(iSubstituteCopyName(text, nullptr, 0, nullptr), text) << "no name: the input itself";
    EXPECT_EQ(iSubstituteCopyName("none", "X", 0, nullptr), std::string("none"));
    EXPECT_EQ(iSubstituteCopyName(nullptr, "X", 0, nullptr), nullptr);
    EXPECT_EQ(iSubstituteCopyName(text, "X", 1024, nullptr), nullptr) << "a size without an output";

    const char* const shared = iSubstituteCopyName(text, "first", 0, nullptr);
    EXPECT_STREQ(shared, "first");
    EXPECT_EQ(iSubstituteCopyName(text, "second", 0, nullptr), shared) << "one buffer for all";
    EXPECT_STREQ(shared, "second");

    char output[40];
    EXPECT_EQ(iSubstituteCopyName(text, "X", 25, output), nullptr) << "refused although the result would fit";
    EXPECT_EQ(iSubstituteCopyName(text, "X", 26, output), output);
    EXPECT_STREQ(output, "X");
    EXPECT_EQ(iSubstituteCopyName("none", "X", sizeof output, output), std::string("none"));
    EXPECT_STREQ(output, "none");

    output[26] = '#';
    EXPECT_EQ(iSubstituteCopyName(text, std::string(60, 'n').c_str(), 26, output), output);
    EXPECT_EQ(std::string(output), std::string(25, 'n')) << "cut to the size and terminated";
    EXPECT_EQ(output[26], '#') << "never past it";

    const std::string longer(2000, 'l');
    EXPECT_EQ(iSubstituteCopyName(longer.c_str(), "X", 0, nullptr), longer.c_str()) << "unchanged, it needs no room";
    std::string room(2001, '#');
    EXPECT_EQ(iSubstituteCopyName(longer.c_str(), nullptr, 2001, room.data()), longer.c_str());
    EXPECT_EQ(room.c_str(), longer);
    const std::string filled = std::string(iSubstituteCopyName(text, std::string(2000, 'n').c_str(), 0, nullptr));
    EXPECT_EQ(filled.size(), kSubstitutedSize - 1);
}

}  // namespace
}  // namespace kz7
