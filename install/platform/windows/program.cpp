#include "install/platform/program.h"

#include <windows.h>

#include <new>
#include <vector>

#include "install/platform/windows/wide_text.h"

namespace kz7 {

std::FILE* openInput(const char* path) {
    return _wfopen(WideText(path).c_str(), L"rb");
}

}  // namespace kz7

// Takes the wide vector of the C runtime. CommandLineToArgvW() splits `"a""b" c` differently, and the narrow vector is
// split after a conversion that turns U+FF02 into a quotation mark.
int wmain(int argc, wchar_t** argv) {
    try {
        std::vector<std::string> words;
        words.reserve(static_cast<std::size_t>(argc));
        for (int i = 0; i < argc; ++i) {
            words.push_back(kz7::textFromWide(argv[i]));
        }
        std::vector<char*> vector;
        vector.reserve(words.size() + 1);
        for (std::string& word : words) {
            vector.push_back(word.data());
        }
        vector.push_back(nullptr);
        return kz7::programMain(argc, vector.data());
    } catch (const std::bad_alloc&) {
        std::fputs("out of memory\n", stderr);
        return ERROR_OUTOFMEMORY;
    }
}
