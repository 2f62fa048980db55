// Attributes of new threads on this host.
#pragma once

#include <pthread.h>

#include <cstddef>

namespace kz7 {

// Prepares a thread that receives no signals and has a stack of that many bytes (0: the default size). Returns an error
// number, or 0 and attributes that the caller destroys.
int makeThreadAttributes(std::size_t stackBytes, pthread_attr_t& attributes);

}  // namespace kz7
