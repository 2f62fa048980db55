// What every service manager must do alike: the one in memory and this machine's.
#include <gtest/gtest.h>

#include <chrono>
#include <thread>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class ServicesContract : public testing::TestWithParam<const char*> {
protected:
    ServicesContract() { EXPECT_EQ(services_.openManager(kServiceManagerAllAccess, manager_.receive()), kSuccess); }
    ~ServicesContract() override {
        OwnedService service(services_);
        if (open(kName, service) == kSuccess) {
            services_.stopService(service.get());
            services_.deleteService(service.get());
        }
    }

    Status create(OwnedService& service, std::string_view name, const std::string& program) {
        const ServiceDefinition definition{.name = name, .displayName = "Contract test", .programPath = program};
        return services_.createService(manager_.get(), definition, service.receive());
    }
    Status open(std::string_view name, OwnedService& service, std::uint32_t access = kServiceAllAccess) {
        return services_.openService(manager_.get(), name, access, service.receive());
    }
    // The state it comes to, once it is not on its way any more.
    ServiceState settled(const OwnedService& service) {
        const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(30);
        ServiceState state{};
        do {
            EXPECT_EQ(services_.queryState(service.get(), state), kSuccess);
            std::this_thread::yield();
        } while ((state == ServiceState::startPending || state == ServiceState::stopPending) &&
                 std::chrono::steady_clock::now() < end);
        return state;
    }

    static constexpr auto kName = "KZ7ContractTest";
    std::unique_ptr<Backend> backend_ = backendNamed(GetParam());
    IServiceManager& services_ = backend_->platform().services();
    OwnedService manager_{services_};
};

INSTANTIATE_TEST_SUITE_P(Managers, ServicesContract, testing::ValuesIn(kBackends));

TEST_P(ServicesContract, AServiceIsMadeFoundRunAndDeleted) {
    OwnedService service(services_);
    EXPECT_EQ(open(kName, service), kServiceDoesNotExist);
    ASSERT_EQ(create(service, kName, backend_->program()), kSuccess);
    EXPECT_EQ(settled(service), ServiceState::stopped);
    OwnedService second(services_);
    EXPECT_EQ(create(second, "kz7CONTRACTtest", backend_->program()), kServiceExists) << "names compare without case";
    EXPECT_FALSE(second);
    EXPECT_EQ(open("kz7CONTRACTtest", second), kSuccess);

    EXPECT_EQ(services_.stopService(service.get()), kServiceNotActive);
    EXPECT_EQ(services_.startService(service.get()), kSuccess);
    EXPECT_EQ(settled(second), ServiceState::running);
    EXPECT_EQ(services_.startService(second.get()), kServiceAlreadyRunning);
    EXPECT_EQ(services_.changeStartType(service.get(), ServiceStart::disabled), kSuccess);
    EXPECT_EQ(settled(service), ServiceState::running) << "a new start type leaves the rest";
    EXPECT_EQ(services_.stopService(service.get()), kSuccess);
    EXPECT_EQ(settled(service), ServiceState::stopped);
    EXPECT_EQ(services_.stopService(second.get()), kServiceNotActive);
    EXPECT_EQ(services_.changeStartType(service.get(), ServiceStart::automatic), kSuccess);
    EXPECT_EQ(services_.startService(service.get()), kSuccess) << "and its program";
    EXPECT_EQ(settled(service), ServiceState::running);
    EXPECT_EQ(services_.stopService(service.get()), kSuccess);
    EXPECT_EQ(settled(service), ServiceState::stopped);

    EXPECT_EQ(services_.deleteService(service.get()), kSuccess);
    EXPECT_EQ(services_.deleteService(second.get()), kServiceMarkedForDelete);
    EXPECT_EQ(services_.changeStartType(second.get(), ServiceStart::demand), kServiceMarkedForDelete);
    EXPECT_EQ(services_.startService(second.get()), kServiceMarkedForDelete);
    service.reset();
    second.reset();
    EXPECT_EQ(open(kName, service), kServiceDoesNotExist);
    EXPECT_EQ(create(service, kName, backend_->program()), kSuccess) << "its name is free again";
}

TEST_P(ServicesContract, AStartWithoutItsProgramFindsNoFile) {
    OwnedService service(services_);
    ASSERT_EQ(create(service, kName, backend_->folder() + "\\absent.exe"), kSuccess);
    EXPECT_EQ(services_.startService(service.get()), kFileNotFound);
    EXPECT_EQ(settled(service), ServiceState::stopped);
}

TEST_P(ServicesContract, NamesThatNoServiceCanHave) {
    // clang-format off
    const struct { const char* why; std::string name; Status created; Status opened; } rows[] = {
        {"empty",            "",                    kInvalidName, kInvalidName},
        {"a slash",          "a/b",                 kInvalidName, kInvalidName},
        {"a backslash",      "a\\b",                kInvalidName, kInvalidName},
        {"257 characters",   std::string(257, 's'), kInvalidName, kInvalidName},
    };
    // clang-format on
    for (const auto& row : rows) {
        OwnedService service(services_);
        EXPECT_EQ(create(service, row.name, backend_->program()), row.created) << row.why;
        EXPECT_EQ(open(row.name, service), row.opened) << row.why;
        EXPECT_FALSE(service) << row.why;
    }
}

TEST_P(ServicesContract, HandlesAreJudgedByWhatTheyAreAndMayDo) {
    OwnedService service(services_);
    ASSERT_EQ(create(service, kName, backend_->program()), kSuccess);
    using Operation = Status (*)(IServiceManager&, ServiceHandle);
    // clang-format off
    const struct { const char* why; Operation operation; Status onlyQuery; } rows[] = {
        {"change", [](IServiceManager& s, ServiceHandle h) { return s.changeStartType(h, ServiceStart::demand); }, kAccessDenied},
        {"start",  [](IServiceManager& s, ServiceHandle h) { return s.startService(h); },                          kAccessDenied},
        {"stop",   [](IServiceManager& s, ServiceHandle h) { return s.stopService(h); },                           kAccessDenied},
        {"delete", [](IServiceManager& s, ServiceHandle h) { return s.deleteService(h); },                         kAccessDenied},
        {"state",  [](IServiceManager& s, ServiceHandle h) { ServiceState x{}; return s.queryState(h, x); },       kSuccess},
    };
    // clang-format on
    OwnedService query(services_);
    ASSERT_EQ(open(kName, query, kServiceQueryStatus), kSuccess);
    OwnedService other(services_);
    ASSERT_EQ(open(kName, other), kSuccess);
    const ServiceHandle closed = other.get();
    other.reset();
    for (const auto& row : rows) {
        EXPECT_EQ(row.operation(services_, closed), kInvalidHandle) << row.why;
        EXPECT_EQ(row.operation(services_, ServiceHandle::none), kInvalidHandle) << row.why;
        EXPECT_EQ(row.operation(services_, manager_.get()), kInvalidHandle) << row.why;
        EXPECT_EQ(row.operation(services_, query.get()), row.onlyQuery) << row.why;
    }
    EXPECT_EQ(services_.openService(service.get(), kName, kServiceAllAccess, other.receive()), kInvalidHandle);
    EXPECT_EQ(services_.closeHandle(closed), kInvalidHandle);
    EXPECT_EQ(services_.closeHandle(ServiceHandle::none), kInvalidHandle);
}

}  // namespace
}  // namespace kz7::test
