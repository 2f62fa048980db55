// Every allocation and every call of a port that the runtime's public operations make fails: no exception leaves them,
// nothing stays open, and the same objects then do their work.
#include <gtest/gtest.h>

#include <map>
#include <set>

#include "install/runtime/config_handler.h"
#include "install/runtime/install_process.h"
#include "install/runtime/installer_properties.h"
#include "install/runtime/observers/display_observer.h"
#include "tests/support/call_observer.h"
#include "tests/support/failing_new.h"
#include "tests/support/runtime_machine.h"

namespace kz7::test {
namespace {

constexpr const char* kLongText = "a text that no string keeps in itself";

// A machine whose observers are registered, and objects that outlive a run that fails.
struct Runtime : RuntimeMachine {
    explicit Runtime(ICallObserver* observer = nullptr) : RuntimeMachine(true, observer) {
        openLog();
        engine.registerObserver(*UREExternalObserverHumanStream::getInstance(engine));
        engine.registerObserver(*UREExternalObserverMachineStream::getInstance(engine));
        engine.installationPath = "C:\\the folder of the first copy";
        processes_.otherPrograms = ScriptedProgram{.output = std::string(2000, 'o'), .error = "an error"};
        files_.add("C:\\profiles\\INST\\kz7systm");
        for (const auto& [path, text] : {std::pair{"C:\\setup.rsp", "A_LONG_ENOUGH_KEYWORD = a long enough value"},
                                         {"C:\\messages", "2003 = \"a note of another language: \""}}) {
            files_.add(path, text);
        }
        session.properties["KZ7_DEFAULT_LANG"] = "iw_IL";
        session.tableRows = {"A_PROPERTY_OF_THE_TABLE"};
        target.instance.assign("INST");
        target.profile.assign("INST");
        OwnedKey key(registry_);
        registry_.createKey(KeyHandle::localMachine, "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\COPY1", {}, 0,
                            key.receive());
        ProfileRegistry(registry_, "COPY1").set("INST", "KZ7INSTPROF", "C:\\profiles");
    }

    Status runProgram() {
        std::uint32_t code = 0;
        for (const Status status : {process.setCommand("C:\\a program.exe with an argument"),
                                    process.execute(true, true), process.waitForCompletion(code, kInfiniteWait)}) {
            if (status != kSuccess) {
                return status;
            }
        }
        process.postOutput("a source", 1);
        return kSuccess;
    }

    Status configure() {
        const std::uint32_t failed = handler.failures();
        for (const Status status :
             {profile.set("INST", "KZ7COMM", kLongText), handler.recordVariable("KZ7COMM", kLongText),
              handler.recordVariable("KZ7ACCOUNT", kLongText), handler.recordParameter("DIAGLEVEL", kLongText),
              handler.recordParameter("NUMDB", kLongText), handler.commitProfileReg(), handler.commitDBMCfg("INST"),
              handler.set_dbm_parameter("INST", 64, "3")}) {
            if (status != kSuccess) {
                return status;
            }
        }
        return handler.failures() == failed ? kSuccess : kParameterNotSet;
    }

    Status talk() {
        for (const Status status :
             {log().setLogFile(kLogFile), engine.registerObserver(display),
              engine.readResponses("RSP_FILE_PATH", "C:\\setup.rsp"),
              engine.readMessages("KZ7_MESSAGES", "C:\\messages"), log().writeLine(std::string_view(kLogFile))}) {
            if (status != kSuccess) {
                return status;
            }
        }
        std::string answer;
        engine.startTask(1, 10, true, "a task\twith a tab");
        engine.ask(1, kMediumNeededMessage, {}, "a default that is long enough", answer);
        engine.error(kCodeError, "Runtime::talk", 10, kNoMemory);
        engine.endTask(10, true, "a task");
        engine.unregisterObserver(display);
        return kSuccess;
    }

    Status useProperties() {
        session.isScheduled = false;
        const Status set = iMsiSetProperty(at, "A_PROPERTY_OF_THE_TABLE", kLongText);
        const Status saved = iSavePropertiesForDeferred(at);
        session.isScheduled = true;
        char room[kPropertySize];
        std::uint32_t size = sizeof room;
        const Status read = iMsiGetProperty(at, "A_PROPERTY_OF_THE_TABLE", room, &size);
        const Status deleted = iDeleteSavedProperties(at);
        for (const Status status : {set, saved, read, deleted}) {
            if (status != kSuccess) {
                return status;
            }
        }
        return size == std::string_view(kLongText).size() + 1 ? kSuccess : kMissingItem;  // not the saved value
    }

    Installation at{installer(), registry(), engine};
    UREDisplayObserverWI display{at};
    ProfileRegistry profile{registry(), "COPY1"};
    ConfigurationTarget target;
    KZ7CfgHandler handler{engine, profile, target};
    InstallProcess process{processes(), threads(), engine, nullptr};
};

// clang-format off
const struct { const char* name; Status (Runtime::*run)(); } kFlows[] = {
    {"program",    &Runtime::runProgram},
    {"configure",  &Runtime::configure},
    {"talk",       &Runtime::talk},
    {"properties", &Runtime::useProperties},
};
// clang-format on

TEST(RuntimeMemory, AnyAllocationMayFail) {
    for (const auto& flow : kFlows) {
        bool through = false;
        int reported = 0;
        for (int number = 0; !through; ++number) {
            SCOPED_TRACE(std::string(flow.name) + " " + std::to_string(number));
            Runtime runtime;
            failAllocation(number);
            const Status status = (runtime.*flow.run)();
            through = !endFailingAllocations();
            reported += status == kNoMemory ? 1 : 0;
            ASSERT_TRUE(!through || status == kSuccess) << status;
            ASSERT_EQ((runtime.*flow.run)(), kSuccess);
        }
        EXPECT_GT(reported, 0) << flow.name;
    }
}

TEST(RuntimeFaults, AnyCallMayFail) {
    constexpr Status kFault = 4321;
    std::map<std::string, std::set<std::string>> failures;  // of the calls that failed once, by flow
    for (const auto& flow : kFlows) {
        for (const bool forGood : {false, true}) {
            bool through = false;
            for (std::uint64_t call = 1; !through; ++call) {
                FaultCounter faults(0, false, kSuccess);
                Runtime runtime(&faults);
                faults = FaultCounter(call, forGood, kFault);
                const Status status = (runtime.*flow.run)();
                SCOPED_TRACE(std::string(flow.name) + ": " + faults.failedCall() + (forGood ? " for good" : ""));
                through = faults.failed().empty();
                if (status != kSuccess && !forGood) {
                    failures[flow.name].insert(faults.failed() + " " + std::to_string(status));
                }
                EXPECT_LE(runtime.handler.failures(), forGood ? 4U : 1U) << "one failure does not stop the others";
                EXPECT_TRUE(runtime.logText().empty() || runtime.logText().ends_with('\n')) << runtime.logText();
                faults = FaultCounter(0, false, kSuccess);
                EXPECT_EQ((runtime.*flow.run)(), kSuccess);
            }
        }
    }
    // The flows succeed although other calls fail.
    const std::map<std::string, std::set<std::string>> expected = {
        // clang-format off
        {"program",    {"createPipe 5030", "duplicate 5030", "exitCode 5082", "setSlot 5030", "startProcess 5082", "startThread 5111"}},
        {"configure",  {"commit 5056", "commit 5057", "createKey 4321", "createKey 5059", "createPipe 5057", "duplicate 5057",
                        "exitCode 5057", "openKey 4321", "openKey 5057", "openKey 5059", "probe 5056", "probe 5057",
                        "queryValue 5057", "setSlot 5057", "setValue 4321", "setValue 5059", "startProcess 5057", "startThread 5057"}},
        {"talk",       {"openForAppend 4321", "readFile 4321", "shortPath 4321", "write 4294967295"}},
        {"properties", {"activeDatabase 6045", "createKey 5021", "deleteKey 4321", "enumerateKey 4321", "executeView 4321",
                        "fetchRecord 4321", "getProperty 5021", "openKey 4321", "openKey 5021", "openView 4321", "queryValue 5021",
                        "recordString 5021", "runMode 5021", "setProperty 4321", "setValue 5021"}},
        // clang-format on
    };
    EXPECT_EQ(failures, expected);
}

}  // namespace
}  // namespace kz7::test
