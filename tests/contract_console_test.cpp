// What every console must do alike: the one in memory and this machine's.
#include <gtest/gtest.h>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class ConsoleContract : public testing::TestWithParam<const char*> {
protected:
    std::unique_ptr<Backend> backend_ = backendNamed(GetParam());
};

INSTANTIATE_TEST_SUITE_P(Consoles, ConsoleContract, testing::ValuesIn(kBackends));

TEST_P(ConsoleContract, TextsComeOutWholeAndAsTheyAre) {
    const std::string text = "100%s %n\n" + std::string(10'000, 'x') + "\xE9\n\nno line feed at the end";
    EXPECT_EQ(backend_->written(false,
                                [&](IConsole& console) {
                                    EXPECT_EQ(console.writeOutput(text), kSuccess);
                                    EXPECT_EQ(console.writeOutput(""), kSuccess);
                                    EXPECT_EQ(console.flush(), kSuccess);
                                    EXPECT_EQ(console.writeError(""), kSuccess);
                                }),
              text);
}

TEST_P(ConsoleContract, BothStreamsKeepTheirOrder) {
    EXPECT_EQ(backend_->written(true,
                                [](IConsole& console) {
                                    console.writeOutput("one ");
                                    console.writeError("two ");
                                    console.writeOutput("three ");
                                    console.writeOutput("four ");
                                    console.writeError("five\n");
                                }),
              "one two three four five\n");
}

}  // namespace
}  // namespace kz7::test
