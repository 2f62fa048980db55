// Any file is refused or imported, and the export of the imported store produces the same store again in both
// encodings.
#include "fuzz/fuzzer.h"
#include "install/admin/formats/reg_text.h"
#include "install/platform/memory/registry.h"
#include "tests/support/reg_text_store.h"

void tryInput(std::string_view input) {
    std::vector<kz7::KeyChange> changes;
    kz7::TextFault bad;
    if (!kz7::parseRegText(input, changes, bad)) {
        check(changes.empty() && bad.line != 0 && !bad.reason.empty());
        return;
    }
    kz7::MemoryRegistry registry;
    std::uint32_t line = 0;
    check(kz7::applyChanges(registry, changes, line) == kz7::kSuccess);
    check(registry.openHandles() == 0);
    const std::string text = kz7::test::exportAll(registry);
    for (const std::string& file : {text, std::string(kz7::kUtf16Mark) + kz7::utf16FileText(text)}) {
        kz7::MemoryRegistry again;
        check(kz7::test::importText(again, file).empty());
        check(kz7::test::exportAll(again) == text);
    }
}
