// What only Windows has: links in the registry and among files, keys that cannot be read, services that end slowly,
// and the lock of programs that change something.
#include <aclapi.h>
#include <gtest/gtest.h>
#include <windows.h>
#include <winternl.h>

#include <filesystem>
#include <thread>

#include "install/platform/windows/run_journal.h"
#include "install/src/registry/key_walk.h"
#include "install/src/registry/registry_access.h"
#include "install/src/services/management_service.h"
#include "tests/support/backends.h"
#include "tests/support/intercepted_ports.h"
#include "tests/support/reg_text_store.h"

extern "C" NTSTATUS NTAPI NtDeleteKey(HANDLE);
extern "C" NTSTATUS NTAPI NtCreateKey(HANDLE*, ACCESS_MASK, OBJECT_ATTRIBUTES*, ULONG, UNICODE_STRING*, ULONG, ULONG*);

namespace kz7::test {
namespace {

class OnWindows : public testing::Test {
protected:
    OnWindows() { removeScratch(); }
    ~OnWindows() override { removeScratch(); }

    void removeScratch() { deleteTree(registry_, KeyHandle::localMachine, kScratch, 0, {}, {}); }
    std::string below(const std::string& path) { return std::string(kScratch) + "\\" + path; }
    OwnedKey make(const std::string& path) {
        OwnedKey key(registry_);
        EXPECT_EQ(registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key.receive()), kSuccess) << path;
        return key;
    }
    bool has(const std::string& path) {
        OwnedKey key(registry_);
        return registry_.openKey(KeyHandle::localMachine, path, kKeyRead, key.receive()) == kSuccess;
    }
    void makeLink(const std::string& path, const std::string& target) {
        HKEY key = nullptr;
        ASSERT_EQ(RegCreateKeyExA(HKEY_LOCAL_MACHINE, path.c_str(), 0, nullptr, REG_OPTION_CREATE_LINK, KEY_ALL_ACCESS,
                                  nullptr, &key, nullptr),
                  ERROR_SUCCESS);
        const std::wstring native = L"\\Registry\\Machine\\" + std::wstring(target.begin(), target.end());
        EXPECT_EQ(RegSetValueExW(key, L"SymbolicLinkValue", 0, REG_LINK, reinterpret_cast<const BYTE*>(native.data()),
                                 static_cast<DWORD>(native.size() * sizeof(wchar_t))),
                  ERROR_SUCCESS);
        RegCloseKey(key);
    }
    // The keys below the scratch key's one of that name, those that are links with an asterisk, and what is left out.
    std::string walked(const std::string& name) {
        std::string seen;
        EXPECT_EQ(walkKeys(registry_, {{KeyHandle::localMachine, below(name)}, {}},
                           [&](const KeyRecord& key) {
                               const bool isLink = !key.values.empty() && key.values[0].type == ValueType{REG_LINK};
                               seen += key.status != kSuccess ? "<" + std::to_string(key.status) + ">"
                                                              : key.name.substr(key.name.find_last_of('\\') + 1);
                               seen += isLink ? "* " : " ";
                               return seen.size() < 200 ? kSuccess : kFailed;
                           }),
                  kSuccess);
        return seen;
    }

    static constexpr auto kScratch = "SOFTWARE\\KZ7 test of Windows";
    static constexpr auto kTree = "SOFTWARE\\KZ7 test of Windows\\Tree";
    static constexpr auto kCopy = "SOFTWARE\\KZ7 test of Windows\\Copy";
    std::unique_ptr<Backend> backend_ = backendNamed("host");
    IPlatform& platform_ = backend_->platform();
    IRegistryStore& registry_ = platform_.registry();
};

TEST_F(OnWindows, NoWalkFollowsALinkInTheRegistry) {
    const auto lay = [this] {
        make(below("Target\\Below"));
        make(below("Tree\\Own"));
        makeLink(below("Tree\\Away"), below("Target"));
        makeLink(below("Tree\\Loop"), below("Tree"));
    };
    lay();
    EXPECT_EQ(walked("Tree"), "Tree Away* Loop* Own ");
    EXPECT_EQ(
        TreeCopy(registry_).copy(KeyHandle::localMachine, below("Tree"), KeyHandle::localMachine, below("Copy"), true),
        kAccessDenied);
    EXPECT_FALSE(has(below("Copy\\Away\\Below")));
    makeLink(below("Link"), below("Target"));
    EXPECT_EQ(TreeCopy(registry_).copy(KeyHandle::localMachine, below("Tree\\Own"), KeyHandle::localMachine,
                                       below("Link"), true),
              kAccessDenied)
        << "nor is anything copied through one";
    EXPECT_EQ(deleteTree(registry_, KeyHandle::localMachine, below("Tree"), 0, {}, {}), kSuccess);
    EXPECT_TRUE(has(below("Target\\Below")) && !has(below("Tree")));
    lay();
    EXPECT_EQ(importText(registry_, "REGEDIT4\n[-HKEY_LOCAL_MACHINE\\" + below("Tree") + "]\n"), "");
    EXPECT_TRUE(has(below("Target\\Below")) && !has(below("Tree")));
}

// Runs something each time that a call of a port names that key.
struct Intruder : ICallObserver {
    Intruder(std::string seen, std::function<void()> act) : seen_(std::move(seen)), act_(std::move(act)) {}
    void after(const PortCall& call) override {
        if (call.text().find(seen_) != std::string::npos) {
            std::exchange(act_, [] {})();
        }
    }
    std::string seen_;
    std::function<void()> act_;
};

TEST_F(OnWindows, NoWalkFollowsALinkThatAppearsInItsWay) {
    const auto walk = [](IRegistryStore& registry, bool isCopy) {
        return isCopy ? TreeCopy(registry).copy(KeyHandle::localMachine, kTree, KeyHandle::localMachine, kCopy, true)
                      : deleteTree(registry, KeyHandle::localMachine, kTree, 0, {}, {});
    };
    for (const bool isCopy : {true, false}) {
        make(below("Target\\Leaf\\Secret"));
        make(below("Tree\\Mid\\Leaf"));
        Intruder intruder("\"Leaf\"", [&] {
            registry_.deleteKey(KeyHandle::localMachine, below("Tree\\Mid\\Leaf"), 0);
            registry_.deleteKey(KeyHandle::localMachine, below("Tree\\Mid"), 0);
            makeLink(below("Tree\\Mid"), below("Target"));
        });
        InterceptedRegistry watched(registry_, intruder);
        EXPECT_EQ(walk(watched, isCopy), kKeyDeleted);
        EXPECT_TRUE(has(below("Target\\Leaf\\Secret")) && !has(below("Copy\\Mid\\Leaf\\Secret")));
        deleteTree(registry_, KeyHandle::localMachine, kTree, 0, {}, {});
    }
}

TEST_F(OnWindows, KeysThatCannotBeReadAreLeftOutAndTold) {
    const OwnedKey parent = make(below("Tree"));
    make(below("Tree\\Last"));
    const OwnedKey locked = make(below("Tree\\Locked"));
    const auto native = [](const OwnedKey& key) { return LongToHandle(static_cast<LONG>(key.get())); };
    wchar_t text[] = L"with\0NUL";
    UNICODE_STRING name{sizeof text - sizeof *text, sizeof text, text};
    OBJECT_ATTRIBUTES attributes{};
    InitializeObjectAttributes(&attributes, &name, 0, native(parent), nullptr);
    HANDLE withNul = nullptr;
    ASSERT_GE(NtCreateKey(&withNul, KEY_ALL_ACCESS, &attributes, 0, nullptr, 0, nullptr), 0);
    ACL nobody{};
    ASSERT_TRUE(InitializeAcl(&nobody, sizeof nobody, ACL_REVISION));
    const auto protect = [&](ACL* rights) {
        return SetSecurityInfo(native(locked), SE_REGISTRY_KEY, DACL_SECURITY_INFORMATION, nullptr, nullptr, rights,
                               nullptr);
    };
    ASSERT_EQ(protect(&nobody), static_cast<DWORD>(ERROR_SUCCESS));
    EXPECT_EQ(walked("Tree"), "Tree Last <5> <87> ");
    protect(nullptr);
    NtDeleteKey(withNul);
    CloseHandle(withNul);
}

TEST_F(OnWindows, ALogIsAFileOfOneNameInItsPlace) {
    const std::string folder = backend_->folder() + "\\";
    IFileSystem& files = platform_.files();
    OwnedFile file(files);
    ASSERT_EQ(files.openForAppend(folder + "precious", file.receive()), kSuccess);
    file.reset();
    ASSERT_TRUE(CreateHardLinkA((folder + "linked.log").c_str(), (folder + "precious").c_str(), nullptr));
    for (const std::string name : {"linked.log", "precious", "NUL", "nul", "NUL.log"}) {
        const bool device = name != "linked.log" && name != "precious";
        const Status status = files.openForAppend(folder + name, file.receive());
        // Later systems take the names of devices in a folder for those of files.
        EXPECT_TRUE(status == kAccessDenied || (device && std::filesystem::exists(folder + name))) << name;
        file.reset();
    }
    ASSERT_TRUE(DeleteFileA((folder + "linked.log").c_str()));
    EXPECT_EQ(files.openForAppend(folder + "folder\\..\\precious", file.receive()), kSuccess);
}

TEST_F(OnWindows, FoldersOfTheSearchPathMayBeQuoted) {
    const std::string folder = backend_->folder() + "\\two  words";
    std::filesystem::create_directory(folder);
    std::filesystem::copy_file(childProgram(), folder + "\\kz7_quoted.exe");
    const std::string before = std::getenv("PATH");
    const struct {
        std::string path;
        Status status;
    } rows[] = {
        {folder, kSuccess},
        {'"' + folder + '"', kSuccess},
        {"C:\\none;\"" + folder + "\\\";;.", kSuccess},
        {'"' + folder, kSuccess},
        {"\"C:\\none;" + folder + '"', kFileNotFound},
        {"\".\"", kFileNotFound},
    };
    for (const auto& row : rows) {
        setSearchPath(row.path);
        ProcessInformation child;
        EXPECT_EQ(platform_.processes().startProcess(
                      {"kz7_quoted arguments", {}, StreamHandle::none, StreamHandle::none}, child),
                  row.status)
            << row.path;
        EXPECT_EQ(std::getenv("PATH"), row.path);
        for (const ProcessHandle handle : {child.process, child.mainThread}) {
            platform_.processes().waitProcess(child.process, kInfiniteWait);
            platform_.processes().closeProcess(handle);
        }
    }
    setSearchPath(before);
}

TEST_F(OnWindows, AServiceThatEndsSlowlyIsWaitedFor) {
    const char* const name = "KZ7TestOfWindows";
    const HANDLE gate = CreateEventA(nullptr, TRUE, FALSE, (std::string("Global\\") + name).c_str());
    IServiceManager& services = platform_.services();
    OwnedService manager(services);
    OwnedService service(services);
    const std::string program = backend_->program();
    ASSERT_EQ(services.openManager(kServiceManagerAllAccess, manager.receive()), kSuccess);
    ASSERT_EQ(services.createService(manager.get(), {.name = name, .displayName = name, .programPath = program},
                                     service.receive()),
              kSuccess);
    // A machine that is still starting its own services starts no other.
    ASSERT_TRUE(eventually([&] { return services.startService(service.get()) == kSuccess; }));
    ServiceState state{};
    const auto becomes = [&](ServiceState expected) {
        return eventually([&] { return services.queryState(service.get(), state) == kSuccess && state == expected; });
    };
    ASSERT_TRUE(becomes(ServiceState::running));
    registry_.commit();

    Status status = kFailed;
    std::thread removal([&] {
        const auto other = hostPlatform({.program = "test"});
        status = deleteServiceByName(other->services(), name);
    });
    EXPECT_TRUE(becomes(ServiceState::stopPending));
    EXPECT_EQ(services.waitForStop(service.get(), 1), kWaitTimedOut);
    EXPECT_EQ(services.changeStartType(service.get(), ServiceStart::demand), kSuccess) << "not deleted yet";
    SetEvent(gate);
    removal.join();
    EXPECT_EQ(status, kSuccess);
    EXPECT_EQ(services.changeStartType(service.get(), ServiceStart::demand), kServiceMarkedForDelete);

    std::thread creation([&] {
        const auto other = hostPlatform({.program = "test"});
        OwnedService manager2(other->services());
        OwnedService made(other->services());
        other->services().openManager(kServiceManagerAllAccess, manager2.receive());
        status = other->services().createService(
            manager2.get(), {.name = name, .displayName = name, .programPath = program, .deletionWait = 30'000},
            made.receive());
        other->services().deleteService(made.get());
    });
    service.reset();
    creation.join();
    EXPECT_EQ(status, kSuccess);
    CloseHandle(gate);
}

TEST_F(OnWindows, ProgramsThatChangeSomethingHaveTheirTurns) {
    make(below("Held"));
    const auto other = hostPlatform({.program = "second"});
    const auto reader = hostPlatform({.program = "reader", .readOnly = true});
    OwnedKey key(other->registry());
    OwnedKey read(reader->registry());
    OwnedService manager(other->services());
    const auto open = [&] { return other->registry().openKey(KeyHandle::users, {}, kKeyRead, key.receive()); };
    EXPECT_EQ(reader->registry().openKey(KeyHandle::users, {}, kKeyRead, read.receive()), kSuccess);
    EXPECT_EQ(open(), kBusy);
    EXPECT_EQ(other->services().openManager(kServiceManagerConnect, manager.receive()), kBusy);
    EXPECT_TRUE(other->storeFaultTold());
    EXPECT_EQ(other->registry().commit(), kBusy) << "nothing was kept";
    registry_.commit();
    EXPECT_EQ(open(), kSuccess);
    key.reset();
    EXPECT_EQ(other->registry().commit(), kSuccess);
}

// However a journal is cut or changed, what is read of it is what was written, or nothing.
TEST(RunJournal, IsReadAsItWasWritten) {
    HistoryRun run;
    run.program = "kz7InstallReg";
    run.arguments = {"-v9", "C:\\a b"};
    JournalWriter writer;
    std::string journal = journalHead(writer, run, "this");
    const std::vector<std::string> parts = {"first", std::string("se\0ond", 6), std::string(300, 'x')};
    for (const std::string& part : parts) {
        journal += writer.record(JournalRecord::change, part);
    }
    journal += journalEnd(writer, 7, 1000, {1, 2, 3});
    const auto isPrefix = [&](const HistoryChanges& changes) {
        return changes.parts.size() <= parts.size() &&
               std::equal(changes.parts.begin(), changes.parts.end(), parts.begin());
    };
    HistoryRun read;
    HistoryChanges changes;
    ASSERT_EQ(readJournal(journal, "this", read, changes), kSuccess);
    EXPECT_EQ(changes.parts, parts);
    EXPECT_EQ(read.arguments, run.arguments);
    EXPECT_EQ(read.status, 7U);
    EXPECT_FALSE(read.isForeign || changes.isLastUncertain);
    for (std::size_t at = 0; at < journal.size(); ++at) {
        const Status torn = readJournal(journal.substr(0, at), "that", read, changes);
        EXPECT_TRUE(isPrefix(changes) && torn == (changes.parts.empty() ? kFileNotFound : kSuccess)) << at;
        EXPECT_TRUE(changes.isLastUncertain && (torn != kSuccess || read.isForeign)) << at;
        std::string changed = journal;
        changed[at] = static_cast<char>(changed[at] ^ 1);
        const Status status = readJournal(changed, "this", read, changes);
        EXPECT_TRUE(isPrefix(changes) && (status == kInvalidData || changes.isLastUncertain)) << at;
    }
}

}  // namespace
}  // namespace kz7::test
