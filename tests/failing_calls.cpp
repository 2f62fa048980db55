// Preloaded into a program under test: the n-th call of the kind KZ7_FAIL_CALL fails, once or from there on, but not in
// its child programs. The first two allocations, which the loader and the C++ library make, always succeed.
#include <dlfcn.h>
#include <sys/types.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

extern "C" ssize_t write(int, const void*, std::size_t);

namespace {

bool fails(const char* kind, long notCounted) {
    static const char* chosen = std::getenv("KZ7_FAIL_CALL");
    static const char* at = std::getenv("KZ7_FAIL_AT");
    static const char* lasting = std::getenv("KZ7_FAIL_FOR_GOOD");
    static long count = 0;
    if (chosen == nullptr || at == nullptr || std::strcmp(chosen, kind) != 0) {
        return false;
    }
    const long number = ++count - notCounted;
    const long first = std::atol(at);
    return number == first || (lasting != nullptr && *lasting == '1' && number > first);
}

// The program may succeed despite the failure.
void report() {
    write(2, "a call fails\n", 13);
}

// One instance for each signature and name, which stores the real function.
template <typename Result, typename... Arguments>
Result real(const char* name, Arguments... arguments) {
    return reinterpret_cast<Result (*)(Arguments...)>(dlsym(RTLD_NEXT, name))(arguments...);
}

template <typename... Arguments>
void* allocate(const char* name, Arguments... arguments) {
    static const auto allocation = reinterpret_cast<void* (*)(Arguments...)>(dlsym(RTLD_NEXT, name));
    if (fails("malloc", 2)) {
        report();
        errno = ENOMEM;
        return nullptr;
    }
    return allocation(arguments...);
}

template <typename Result, typename... Arguments>
Result call(const char* kind, const char* name, Arguments... arguments) {
    if (fails(kind, 0)) {
        report();
        errno = ENOSPC;
        return -1;
    }
    return real<Result>(name, arguments...);
}

__attribute__((constructor)) void leaveChildrenAlone() {
    unsetenv("LD_PRELOAD");
}

}  // namespace

// clang-format off
extern "C" {
void* malloc(std::size_t size) { return allocate("malloc", size); }
void* realloc(void* block, std::size_t size) { return allocate("realloc", block, size); }
int open(const char* path, int flags, mode_t mode) { return call<int>("open", "open", path, flags, mode); }
int open64(const char* path, int flags, mode_t mode) { return call<int>("open", "open64", path, flags, mode); }
int openat(int at, const char* path, int flags, mode_t mode) { return call<int>("open", "openat", at, path, flags, mode); }
int mkdir(const char* path, mode_t mode) { return call<int>("mkdir", "mkdir", path, mode); }
int renameat(int from, const char* path, int to, const char* name) { return call<int>("rename", "renameat", from, path, to, name); }
int fsync(int file) { return call<int>("sync", "fsync", file); }
int fdatasync(int file) { return call<int>("sync", "fdatasync", file); }
int ftruncate64(int file, off_t size) { return call<int>("ftruncate", "ftruncate64", file, size); }
ssize_t pwrite64(int file, const void* data, std::size_t size, off_t at) { return call<ssize_t>("pwrite", "pwrite64", file, data, size, at); }
}
// clang-format on
