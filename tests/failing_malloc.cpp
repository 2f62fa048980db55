// Preloaded into a program under test: the n-th allocation fails, once or from there on. The first two of a
// process, the loader's own and the C++ library's reserve for exceptions, always succeed.
#include <dlfcn.h>

#include <cerrno>
#include <cstdlib>

namespace {

bool fails() {
    static const char* chosen = std::getenv("KZ7_FAIL_ALLOCATION");
    static const char* lasting = std::getenv("KZ7_FAIL_FOR_GOOD");
    static long count = -2;
    if (chosen == nullptr) {
        return false;
    }
    ++count;
    const long at = std::atol(chosen);
    return count == at || (lasting != nullptr && *lasting == '1' && count > at);
}

template <typename Function>
Function next(const char* name) {
    return reinterpret_cast<Function>(dlsym(RTLD_NEXT, name));
}

}  // namespace

extern "C" void* malloc(std::size_t size) {
    static const auto real = next<void* (*)(std::size_t)>("malloc");
    if (fails()) {
        errno = ENOMEM;
        return nullptr;
    }
    return real(size);
}

extern "C" void* realloc(void* block, std::size_t size) {
    static const auto real = next<void* (*)(void*, std::size_t)>("realloc");
    if (fails()) {
        errno = ENOMEM;
        return nullptr;
    }
    return real(block, size);
}
