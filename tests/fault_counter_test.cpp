// The fault counter itself: a sweep would pass unseen over calls that never fail.
#include <gtest/gtest.h>

#include "install/platform/faulty/console.h"
#include "install/platform/faulty/registry.h"
#include "install/platform/memory/platform.h"

namespace kz7::test {
namespace {

TEST(FaultCounterTest, CountsOverAllPortsAndFailsTheChosenCall) {
    for (const bool forGood : {false, true}) {
        MemoryPlatform machine;
        FaultCounter faults(2, forGood, kDiskFull);
        FaultyRegistry registry(machine.registry_, faults);
        FaultyConsole console(machine.console_, faults);
        const Status later = forGood ? kDiskFull : kSuccess;
        KeyHandle key = KeyHandle::none;
        EXPECT_EQ(registry.createKey(KeyHandle::localMachine, "K", {}, kKeyFull, key), kSuccess);
        EXPECT_EQ(faults.failed(), "");
        EXPECT_EQ(console.writeOutput("lost"), kDiskFull);
        EXPECT_EQ(registry.setValue(key, "v", ValueType::binary, "x"), later);
        EXPECT_EQ(registry.closeKey(key), later);
        EXPECT_EQ(machine.registry_.openHandles(), 0U) << "a close that fails closes all the same";
        EXPECT_EQ(registry.commit(), later);
        EXPECT_EQ(machine.registry_.commits(), forGood ? 0U : 1U);
        EXPECT_EQ(machine.console_.output, "") << "a call that fails is not made";
        EXPECT_EQ(faults.failed(), "writeOutput") << "the first one";
        EXPECT_EQ(faults.calls(), 5U);
    }
}

}  // namespace
}  // namespace kz7::test
