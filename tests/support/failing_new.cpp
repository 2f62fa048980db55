#include "tests/support/failing_new.h"

#include <cstdlib>
#include <new>

namespace {

thread_local int allocationsLeft = -1;
thread_local bool hasFailed = false;

}  // namespace

namespace kz7::test {

void failAllocation(int number) {
    allocationsLeft = number;
    hasFailed = false;
}

bool endFailingAllocations() {
    allocationsLeft = -1;
    return hasFailed;
}

}  // namespace kz7::test

// Every form is replaced: a sanitizer would otherwise use its own, which never fail.
void* operator new(std::size_t size) {
    hasFailed = hasFailed || allocationsLeft == 0;
    void* const block = allocationsLeft == 0 ? nullptr : std::malloc(size == 0 ? 1 : size);
    allocationsLeft -= allocationsLeft >= 0 ? 1 : 0;
    if (block == nullptr) {
        throw std::bad_alloc();
    }
    return block;
}

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
    try {
        return operator new(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

void* operator new[](std::size_t size) {
    return operator new(size);
}

void* operator new[](std::size_t size, const std::nothrow_t& tag) noexcept {
    return operator new(size, tag);
}

void operator delete(void* block) noexcept {
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept {
    std::free(block);
}

void operator delete[](void* block) noexcept {
    std::free(block);
}

void operator delete[](void* block, std::size_t) noexcept {
    std::free(block);
}
