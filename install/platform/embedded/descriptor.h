// The owner of a file descriptor.
#pragma once

#include <unistd.h>

#include <cerrno>
#include <string_view>

#include "install/platform/owned_handle.h"

namespace kz7 {

// Descriptors belong to the process, so this port has no state.
struct DescriptorTraits {
    struct Port {};
    using Handle = int;
    static constexpr Handle kNone = -1;
    static inline Port process;
    // Preserves errno: callers often read the reason of a failure after its descriptors are closed.
    static void close(Port&, Handle descriptor) {
        const int error = errno;
        ::close(descriptor);
        errno = error;
    }
};

class OwnedDescriptor : public OwnedHandle<DescriptorTraits> {
public:
    // Owns the result of a call that opens a descriptor; -1 is no descriptor.
    explicit OwnedDescriptor(int descriptor = DescriptorTraits::kNone) : OwnedHandle(DescriptorTraits::process) {
        receive() = descriptor;
    }
};

// Returns what is left after a failure; errno is its reason.
inline std::string_view writeAll(int descriptor, std::string_view bytes) {
    while (!bytes.empty()) {
        const ssize_t written = ::write(descriptor, bytes.data(), bytes.size());
        if (written == -1 && errno != EINTR) {
            break;
        }
        bytes.remove_prefix(written == -1 ? 0 : static_cast<std::size_t>(written));
    }
    return bytes;
}

}  // namespace kz7
