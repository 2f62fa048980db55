// Whatever a file holds, it is refused or it imports; and what it made exports to a text that makes the same
// store again, in both encodings.
#include <cstdint>
#include <cstdio>
#include <cstdlib>

#include "install/admin/reg_text.h"
#include "install/platform/memory/registry.h"
#include "tests/support/reg_text_store.h"

namespace {

void check(bool holds, const char* what) {
    if (!holds) {
        std::fprintf(stderr, "%s\n", what);
        std::abort();
    }
}

void checkAgain(const std::string& file, const std::string& text) {
    kz7::MemoryRegistry again;
    check(kz7::test::importText(again, file).empty(), "an export is refused");
    check(kz7::test::exportAll(again) == text, "an export makes another store");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view file(reinterpret_cast<const char*>(data), size);
    std::vector<kz7::KeyChange> changes;
    kz7::TextFault bad;
    if (!kz7::parseRegText(file, changes, bad)) {
        check(changes.empty() && bad.line != 0 && !bad.reason.empty(), "a refusal does not say why");
        return 0;
    }
    kz7::MemoryRegistry registry;
    std::uint32_t line = 0;
    check(kz7::applyChanges(registry, changes, line) == kz7::kSuccess, "a checked file cannot be done");
    check(registry.openHandles() == 0, "a handle is left open");
    const std::string text = kz7::test::exportAll(registry);
    checkAgain(text, text);
    checkAgain(std::string(kz7::kUtf16Mark) + kz7::utf16FileText(text), text);
    return 0;
}
