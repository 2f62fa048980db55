// Attributes of new threads on this host.
#pragma once

#include <pthread.h>

#include <cstddef>

namespace kz7 {

// Attributes of a thread that receives no signals and has a stack of that many bytes (0: the default size). Returns 0
// or an error number. The caller destroys the attributes.
int makeThreadAttributes(std::size_t stackBytes, pthread_attr_t& attributes);

}  // namespace kz7
