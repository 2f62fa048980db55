// A whole machine in memory, and a command of the tool run on it.
#pragma once

#include <string>
#include <vector>

#include "install/platform/memory/platform.h"
#include "install/src/registry_access.h"
#include "install/src/uselvlkz7reg.h"
#include "tests/support/registry_dump.h"

namespace kz7::test {

class Machine : public MemoryPlatform {
public:
    // Runs a command with fresh console texts; the arguments without the program's name.
    Status run(const std::vector<std::string>& arguments) {
        console_.output.clear();
        console_.error.clear();
        std::vector<const char*> all = {"kz7InstallReg"};
        for (const std::string& argument : arguments) {
            all.push_back(argument.c_str());
        }
        return runTool(*this, all);
    }

    void set(const std::string& path, const std::string& name, const std::string& data) {
        setText(registry_, path, name, data);
    }
    void make(const std::string& path, const std::string& keyClass = {}) {
        OwnedKey key(registry_);
        registry_.createKey(KeyHandle::localMachine, path, keyClass, kKeyFull, key.receive());
    }
    bool has(const std::string& path) {
        OwnedKey key(registry_);
        return registry_.openKey(KeyHandle::localMachine, path, kKeyRead, key.receive()) == kSuccess;
    }
    std::string dump(const std::string& path = {}) { return dumpRegistry(registry_, KeyHandle::localMachine, path); }
};

}  // namespace kz7::test
