// Preloaded into a program under test: the n-th allocation fails, once or from there on. The first two of a
// process, the loader's own and the C++ library's reserve for exceptions, always succeed.
#include <dlfcn.h>

#include <cerrno>
#include <cstdlib>

static bool fails() {
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

// One for malloc and one for realloc: each keeps the real function of its name.
template <typename... Arguments>
static void* allocate(const char* name, Arguments... arguments) {
    static const auto real = reinterpret_cast<void* (*)(Arguments...)>(dlsym(RTLD_NEXT, name));
    if (fails()) {
        errno = ENOMEM;
        return nullptr;
    }
    return real(arguments...);
}

extern "C" void* malloc(std::size_t size) {
    return allocate("malloc", size);
}

extern "C" void* realloc(void* block, std::size_t size) {
    return allocate("realloc", block, size);
}
