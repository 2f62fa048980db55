// The boundary of the runtime's public operations: no exception leaves them.
#pragma once

#include <new>

#include "install/platform/status.h"

namespace kz7 {

// The status of `work`; kNoMemory when memory ran out, kGeneralFailure for any other exception.
template <typename Work>
Status guarded(Work work) {
    try {
        return work();
    } catch (const std::bad_alloc&) {
        return kNoMemory;
    } catch (...) {
        return kGeneralFailure;
    }
}

}  // namespace kz7
