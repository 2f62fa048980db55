// A machine in memory that runs commands of the tool.
#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>
#include <vector>

#include "install/platform/memory/platform.h"
#include "install/src/registry/registry_access.h"
#include "install/src/uselvlkz7reg.h"
#include "tests/support/registry_dump.h"

namespace kz7::test {

// The beginning of an error line, up to its line number.
inline const std::string kPrefix = "install\\src\\uselvlkz7reg.cpp:";

// Nothing of it may be open at the end.
class Machine : public MemoryPlatform {
public:
    ~Machine() override {
        EXPECT_EQ(registry_.openHandles(), 0U);
        EXPECT_EQ(processes_.openHandles() + threads_.openHandles(), 0U);
        EXPECT_EQ(libraries_.loaded.size(), 0U);
        EXPECT_LE(services_.openHandles(), servicesLeftOpen);
    }

    // Clears the console and runs a command; the arguments do not include the program's name.
    Status run(const std::vector<std::string>& arguments) {
        console_.output.clear();
        console_.error.clear();
        console_.both.clear();
        std::vector<const char*> all = {"kz7InstallReg"};
        for (const std::string& argument : arguments) {
            all.push_back(argument.c_str());
        }
        return runTool(ports_, all);
    }
    // The same, as "output|errors|status".
    std::string result(const std::vector<std::string>& arguments) {
        const Status status = run(arguments);
        return console_.output + "|" + console_.error + "|" + std::to_string(status);
    }

    void set(const std::string& path, const std::string& name, const std::string& data) {
        setText(registry_, path, name, data);
    }
    void make(const std::string& path, const std::string& keyClass = {}) {
        OwnedKey key(registry_);
        registry_.createKey(KeyHandle::localMachine, path, keyClass, kKeyFull, key.receive());
    }
    // The record of a service as text; empty without one.
    std::string service(const std::string& name) {
        const std::string path = "SYSTEM\\CurrentControlSet\\Services\\" + name;
        return has(path) ? dump(path) : "";
    }
    bool runs(const std::string& name) { return service(name).find("CurrentState = 4:\\x04") != std::string::npos; }
    // A service of another product.
    void addService(const std::string& name, bool running) {
        files_.add("C:\\svc.exe");
        OwnedService manager(services_);
        OwnedService service(services_);
        services_.openManager(kServiceManagerAllAccess, manager.receive());
        services_.createService(manager.get(), {name, "", "C:\\svc.exe"}, service.receive());
        if (running) {
            services_.startService(service.get());
        }
    }
    // Stores bytes unchanged.
    void setRaw(const std::string& path, const std::string& name, std::string_view data,
                ValueType type = ValueType::sz) {
        OwnedKey key(registry_);
        registry_.createKey(KeyHandle::localMachine, path, {}, kKeyFull, key.receive());
        registry_.setValue(key.get(), name, type, data);
    }
    bool has(const std::string& path) {
        OwnedKey key(registry_);
        return registry_.openKey(KeyHandle::localMachine, path, kKeyRead, key.receive()) == kSuccess;
    }
    std::string dump(const std::string& path = {}) { return dumpRegistry(registry_, KeyHandle::localMachine, path); }

    // The values directly under a key, sorted: "name=data name=data", a NUL shown as '!'; "none" without the key.
    std::string values(const std::string& path) {
        OwnedKey key(registry_);
        if (registry_.openKey(KeyHandle::localMachine, path, kKeyRead, key.receive()) != kSuccess) {
            return "none";
        }
        std::set<std::string> sorted;
        FixedBuffer<1024> name;
        FixedBuffer<1024> data;
        for (std::uint32_t i = 0; registry_.enumerateValue(key.get(), i, name, nullptr, &data) == kSuccess; ++i) {
            std::string shown(data.view());
            std::replace(shown.begin(), shown.end(), '\0', '!');
            sorted.insert(std::string(name.view()) + "=" + shown);
        }
        std::string text;
        for (const std::string& value : sorted) {
            text += (text.empty() ? "" : " ") + value;
        }
        return text;
    }

    std::size_t servicesLeftOpen = 0;  // the number that may remain open
};

}  // namespace kz7::test
