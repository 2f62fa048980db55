#include "tests/support/reg_text_store.h"

#include "install/admin/formats/reg_text.h"

namespace kz7::test {

std::string exportAll(IRegistryStore& registry) {
    std::string text = regTextHeader();
    std::vector<KeyStart> starts;
    Status status = findEverything(registry, true, starts);
    for (const KeyStart& start : starts) {
        if (status == kSuccess) {
            status = walkKeys(registry, start, [&](const KeyRecord& key) {
                if (!isBareRoot(key)) {
                    appendRegText(key, text);
                }
                return key.status;
            });
        }
    }
    return status == kSuccess ? text : "error " + std::to_string(status);
}

std::string importText(IRegistryStore& registry, std::string_view file) {
    std::vector<KeyChange> changes;
    TextFault bad;
    if (!parseRegText(file, changes, bad)) {
        return std::to_string(bad.line) + ": " + bad.reason;
    }
    std::uint32_t line = 0;
    const Status status = applyChanges(registry, changes, line);
    return status == kSuccess ? std::string{} : std::to_string(line) + ": error " + std::to_string(status);
}

}  // namespace kz7::test
