// The contract of the service manager port, for the one in memory and this machine's.
#include <gtest/gtest.h>

#include "tests/support/backends.h"

namespace kz7::test {
namespace {

class ServicesContract : public Contract {
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
    Status start(const OwnedService& service) {
        // While a machine starts its own services it starts no others.
        constexpr Status kDatabaseLocked = 1055;
        Status status = kDatabaseLocked;
        eventually([&] { return (status = services_.startService(service.get())) != kDatabaseLocked; });
        return status;
    }
    bool becomes(const OwnedService& service, ServiceState expected) {
        ServiceState state{};
        return eventually([&] { return services_.queryState(service.get(), state) == kSuccess && state == expected; });
    }

    static constexpr auto kName = "KZ7ContractTest";
    IServiceManager& services_ = platform_.services();
    OwnedService manager_{services_};
};

INSTANTIATE_TEST_SUITE_P(Managers, ServicesContract, testing::ValuesIn(kBackends));

TEST_P(ServicesContract, AServiceIsCreatedOpenedRunAndDeleted) {
    OwnedService service(services_);
    OwnedService second(services_);
    EXPECT_EQ(open(kName, service), kServiceDoesNotExist);
    ASSERT_EQ(create(service, kName, backend_->program()), kSuccess);
    EXPECT_TRUE(becomes(service, ServiceState::stopped));
    EXPECT_EQ(create(second, "kz7CONTRACTtest", backend_->program()), kServiceExists) << "names compare without case";
    EXPECT_FALSE(second);
    EXPECT_EQ(open("kz7CONTRACTtest", second), kSuccess);

    EXPECT_EQ(services_.stopService(service.get()), kServiceNotActive);
    for (const ServiceStart type : {ServiceStart::disabled, ServiceStart::automatic}) {
        EXPECT_EQ(start(service), kSuccess);
        EXPECT_TRUE(becomes(second, ServiceState::running));
        EXPECT_EQ(start(second), kServiceAlreadyRunning);
        EXPECT_EQ(services_.changeStartType(service.get(), type), kSuccess);
        EXPECT_TRUE(becomes(service, ServiceState::running)) << "a new start type leaves the rest";
        EXPECT_EQ(services_.stopService(service.get()), kSuccess);
        EXPECT_TRUE(becomes(service, ServiceState::stopped));
        EXPECT_EQ(services_.changeStartType(service.get(), ServiceStart::automatic), kSuccess);
    }

    EXPECT_EQ(services_.deleteService(service.get()), kSuccess);
    EXPECT_EQ(services_.deleteService(second.get()), kServiceMarkedForDelete);
    EXPECT_EQ(services_.changeStartType(second.get(), ServiceStart::demand), kServiceMarkedForDelete);
    if (!backend_->differences().startsDeletedServices) {
        EXPECT_EQ(start(second), kServiceMarkedForDelete);
    }
    service.reset();
    EXPECT_EQ(create(service, kName, backend_->program()), kServiceMarkedForDelete) << "while it is open elsewhere";
    second.reset();
    // A manager may keep it for a moment.
    EXPECT_TRUE(eventually([&] { return open(kName, service) == kServiceDoesNotExist; }));
    EXPECT_EQ(create(service, kName, backend_->folder() + "\\absent.exe"), kSuccess) << "its name is free again";
    EXPECT_EQ(start(service), kFileNotFound);
    EXPECT_TRUE(becomes(service, ServiceState::stopped));
    for (const std::string& name : {std::string(), std::string("a/b"), std::string("a\\b"), std::string(256, 's')}) {
        EXPECT_EQ(create(second, name, backend_->program()), kInvalidName) << name;
        EXPECT_EQ(open(name, second), kInvalidName) << name;
    }
}

TEST_P(ServicesContract, HandlesAllowWhatTheirKindAndRightsAllow) {
    OwnedService query(services_);
    OwnedService other(services_);
    ASSERT_EQ(create(other, kName, backend_->program()), kSuccess);
    ASSERT_EQ(open(kName, query, kServiceQueryStatus), kSuccess);
    const ServiceHandle closed = other.get();
    other.reset();
    for (const ServiceHandle handle : {closed, ServiceHandle::none, manager_.get(), query.get()}) {
        const Status expected = handle == query.get() ? kAccessDenied : kInvalidHandle;
        EXPECT_EQ(services_.changeStartType(handle, ServiceStart::demand), expected);
        EXPECT_EQ(services_.startService(handle), expected);
        EXPECT_EQ(services_.stopService(handle), expected);
        EXPECT_EQ(services_.deleteService(handle), expected);
        ServiceState state{};
        EXPECT_EQ(services_.queryState(handle, state), handle == query.get() ? kSuccess : kInvalidHandle);
    }
    EXPECT_EQ(services_.openService(query.get(), kName, kServiceAllAccess, other.receive()), kInvalidHandle);
    EXPECT_EQ(services_.closeHandle(closed), kInvalidHandle);
    EXPECT_EQ(services_.closeHandle(ServiceHandle::none), kInvalidHandle);
}

}  // namespace
}  // namespace kz7::test
