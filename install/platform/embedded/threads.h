// How threads of this host start.
#pragma once

#include <pthread.h>

#include <cstddef>

namespace kz7 {

// Prepares a thread that takes no signals and has a stack of that many bytes (0: the usual size). An error number, or 0
// for attributes that the caller destroys.
int makeThreadAttributes(std::size_t stackBytes, pthread_attr_t& attributes);

}  // namespace kz7
