// The memory store and the embedded store treat any path alike; a created key exists and can be deleted. The first line
// is the path, the rest a copy name.
#include "fuzz/fuzzer.h"
#include "install/platform/embedded/paths.h"
#include "install/platform/embedded/registry.h"
#include "install/platform/memory/registry.h"
#include "install/src/registry/copy_name.h"
#include "install/src/registry/registry_access.h"
#include "tests/support/registry_dump.h"
#include "tests/support/temporary_directory.h"

using namespace kz7;

// The results of the operations on a path, and the store after them.
static std::string outcome(IRegistryStore& registry, std::string_view path, AccessMask view) {
    OwnedKey key(registry);
    FixedBuffer<16> data;
    std::string told;
    const auto tell = [&](Status status) { told += std::to_string(status) + "\n" + test::dumpRegistry(registry); };
    tell(registry.openKey(KeyHandle::localMachine, path, kKeyRead | view, key.receive()));
    tell(registry.createKey(KeyHandle::localMachine, path, {}, kKeyFull | view, key.receive()));
    tell(registry.setValue(key.get(), path, ValueType::sz, "x"));
    tell(registry.queryValue(key.get(), path, nullptr, data));
    tell(registry.deleteKey(KeyHandle::localMachine, path, view));
    tell(registry.setValue(key.get(), path, ValueType::sz, "x"));
    return told;
}

void tryInput(std::string_view input) {
    const std::string_view given = input.substr(0, input.find('\n'));
    const std::string_view name = given.size() < input.size() ? input.substr(given.size() + 1) : std::string_view{};
    const std::string path = substituteCopyName(given, name);
    check(name.empty() ? path == given : path.size() + 25 * (given.size() / 25) >= given.size());

    static const test::TemporaryDirectory directory;
    for (const AccessMask view : {AccessMask{0}, kKeyView32}) {
        MemoryRegistry memory;
        // Commits nothing, so that every input starts with an empty store.
        EmbeddedRegistry embedded(directory.path(), false, [](const StoreFault&) { std::abort(); });
        check(outcome(memory, path, view) == outcome(embedded, path, view));
        check(memory.openHandles() == 0);
    }
    const std::string host = hostPath(path, "/state");
    check(host.empty() || host.front() == '/');
}
