// The owner of a file descriptor.
#pragma once

#include <unistd.h>

#include <cerrno>

#include "install/platform/owned_handle.h"

namespace kz7 {

// Descriptors belong to the process, so their port has no state.
struct DescriptorTraits {
    struct Port {};
    using Handle = int;
    static constexpr Handle kNone = -1;
    static inline Port process;
    // Keeps errno: the reason of a failure is often read after its descriptors are closed.
    static void close(Port&, Handle descriptor) {
        const int error = errno;
        ::close(descriptor);
        errno = error;
    }
};

class OwnedDescriptor : public OwnedHandle<DescriptorTraits> {
public:
    // Takes over the result of a call that opens one; -1 is no descriptor.
    explicit OwnedDescriptor(int descriptor = DescriptorTraits::kNone) : OwnedHandle(DescriptorTraits::process) {
        receive() = descriptor;
    }
};

}  // namespace kz7
