// Whatever a path holds, both stores of our own answer it alike; what was made is there, and goes again. The
// first line is the path, the rest a copy name.
#include <cstdint>
#include <cstdlib>

#include "install/platform/embedded/paths.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/memory/registry.h"
#include "install/runtime/copy_name.h"
#include "install/src/registry_access.h"
#include "tests/support/registry_dump.h"
#include "tests/support/temporary_directory.h"

namespace {

using namespace kz7;

void check(bool holds) {
    if (!holds) {
        std::abort();
    }
}

// What the operations on a path give, and what they leave.
std::string outcome(IRegistryStore& registry, std::string_view path, AccessMask view) {
    OwnedKey key(registry);
    FixedBuffer<16> data;
    std::string told = std::to_string(registry.openKey(KeyHandle::localMachine, path, kKeyRead | view, key.receive()));
    const Status made = registry.createKey(KeyHandle::localMachine, path, {}, kKeyFull | view, key.receive());
    told += " " + std::to_string(made) + " " + std::to_string(registry.setValue(key.get(), path, ValueType::sz, "x")) +
            " " + std::to_string(registry.queryValue(key.get(), path, nullptr, data)) + "\n" +
            test::dumpRegistry(registry);
    told += std::to_string(registry.deleteKey(KeyHandle::localMachine, path, view)) + " " +
            std::to_string(registry.setValue(key.get(), path, ValueType::sz, "x")) + "\n";
    key.reset();
    return told + test::dumpRegistry(registry);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view input(reinterpret_cast<const char*>(data), size);
    const std::string_view given = input.substr(0, input.find('\n'));
    const std::string_view name = given.size() < input.size() ? input.substr(given.size() + 1) : std::string_view{};
    const std::string path = substituteCopyName(given, name);
    check(name.empty() ? path == given : path.size() + 25 * (given.size() / 25) >= given.size());

    static const test::TemporaryDirectory directory;
    for (const AccessMask view : {AccessMask{0}, kKeyView32}) {
        MemoryRegistry memory;
        // Nothing is committed, so every input finds the store empty.
        EmbeddedRegistry embedded(directory.path(), false, [](const StoreFault&) { std::abort(); });
        check(outcome(memory, path, view) == outcome(embedded, path, view));
        check(memory.openHandles() == 0);
    }
    const std::string host = hostPath(path, "/state");
    check(host.empty() || host.front() == '/');
    return 0;
}
