// Response files and the message catalogue.
#include <gtest/gtest.h>

#include <string>

#include "install/platform/encoding.h"
#include "install/platform/memory/file_system.h"
#include "install/runtime/message_catalogue.h"
#include "install/runtime/response_file.h"

namespace kz7::test {
namespace {

std::string shown(const std::vector<ResponseKeyword>& keywords) {
    std::string text;
    for (const ResponseKeyword& keyword : keywords) {
        text += keyword.name + '<' + keyword.value + '>';
    }
    return text;
}

TEST(ResponseFile, ReturnsPairsInFileOrderOrTheFirstBadLine) {
    // clang-format off
    const struct { const char* why; std::string file; std::string keywords; } rows[] = {
        {"pairs in their order",            "B = 1\nA=2\nB =3\n",                      "B<1>A<2>B<3>"},
        {"comments and empty lines",        "* one = 1\n\n ; two = 2\n  \t\nA = 1",    "A<1>"},
        {"carriage returns",                "A = 1\r\n\r\nB = 2\r\n",                  "A<1>B<2>"},
        {"a mark of UTF-8",                 "\xEF\xBB\xBF" "A = 1",                    "A<1>"},
        {"blanks around both",              "\t A \t=\t x y \t",                       "A<x y>"},
        {"an empty value",                  "A =\nB = \"\"",                           "A<>B<>"},
        {"quotes keep blanks and comments", "A = \" ;x* \"",                           "A< ;x* >"},
        {"doubled quotes",                  "A = \"say \"\"x\"\"\"",                   "A<say \"x\">"},
        {"quotes inside are text",          "A = x \"y\"",                             "A<x \"y\">"},
        {"more equals signs",               "A = b=c",                                 "A<b=c>"},
        {"dots, digits, other letters",     "KZ7.PASSWORD_1 = \xE4",                   "KZ7.PASSWORD_1<" + textFromNarrow("\xE4") + ">"},
        {"no pair",                         "A = 1\n\nword\nB\n",                      "3: there is no '=' in it"},
        {"no name",                         "* x\n = 1",                               "2: there is no name before the '='"},
        {"a blank in a name",               "A B = 1",                                 "1: a name has letters, digits, '_' and '.' only"},
        {"nothing but that",                "A = \"",                                  "1: the closing quotation mark is missing"},
        {"more than a text",                "A = \"1\" 2",                             "1: there is text after the closing quotation mark"},
        {"a NUL",                           std::string("A = 1\0" "2", 7),             "1: there is a NUL in it"},
    };
    // clang-format on
    for (const auto& row : rows) {
        std::vector<ResponseKeyword> keywords = {{"KEPT", "x", 1}};
        ResponseFault fault;
        const Status status = parseResponseFile(row.file, keywords, fault);
        EXPECT_EQ(status, fault.line == 0 ? kSuccess : kInvalidData) << row.why;
        EXPECT_EQ(status == kSuccess ? shown(keywords) : std::to_string(fault.line) + ": " + std::string(fault.reason),
                  row.keywords)
            << row.why;
        EXPECT_EQ(shown(keywords) == "KEPT<x>", status != kSuccess) << row.why;
    }
    std::vector<ResponseKeyword> keywords;
    ResponseFault fault;
    MemoryFileSystem files;
    EXPECT_EQ(ureReadRspFile(files, "C:\\absent.rsp", keywords, fault), kFileNotFound);
    EXPECT_EQ(fault.line, 0U);
}

std::string textOf(const MessageCatalogue& catalogue, std::uint32_t number, std::vector<Insert> inserts) {
    char room[64];
    std::size_t length = 0;
    const Status status = catalogue.copyText(number, inserts, room, sizeof room, length);
    return status == kSuccess ? std::string(room, length) : "status " + std::to_string(status);
}

TEST(MessageCatalogue, ReturnsBuiltInTextsAndThoseOfAFile) {
    MessageCatalogue catalogue;
    EXPECT_EQ(textOf(catalogue, 2003, {}), "Note: ");
    EXPECT_EQ(textOf(catalogue, 5058, {"A", "1", "I"}), "Database-manager parameter set: A=1, instance I");
    EXPECT_EQ(textOf(catalogue, 5512, {"A", "%s"}), "Registry variable set: A=%s ");
    EXPECT_EQ(textOf(catalogue, 1, {}), "status 5011");
    EXPECT_EQ(catalogue.plainText(5003), "An argument is missing.");
    EXPECT_EQ(catalogue.plainText(5057), "") << "nothing fills its placeholders";

    ResponseFault fault;
    ASSERT_EQ(
        catalogue.load("2003 = \"Hinweis: \"\nGENERIC_DLG_TITLE = Einrichtung\n2034 = %s ist falsch (100%)", fault),
        kSuccess);
    EXPECT_EQ(textOf(catalogue, 2003, {}), "Hinweis: ");
    EXPECT_EQ(catalogue.pattern(kGenericDialogTitle), "Einrichtung");
    EXPECT_EQ(textOf(catalogue, 2034, {"Das"}), "Das ist falsch (100%)");
    EXPECT_EQ(textOf(catalogue, 2004, {}), "ERROR: ") << "texts that the file leaves out stay";

    // clang-format off
    const struct { const char* why; const char* file; std::uint32_t line; } refused[] = {
        {"an unknown number",  "2003 = x\n2002 = y\n4 = z", 3},
        {"a placeholder more", "2003 = %s",                 1},
        {"another kind",       "2012 = %s %u %s",           1},
    };
    // clang-format on
    for (const auto& row : refused) {
        EXPECT_EQ(catalogue.load(row.file, fault), kInvalidData) << row.why;
        EXPECT_EQ(fault.line, row.line) << row.why;
        EXPECT_EQ(textOf(catalogue, 2003, {}), "Hinweis: ") << row.why;
    }
}

}  // namespace
}  // namespace kz7::test
