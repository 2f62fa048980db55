// Keys with their values as JSON.
#pragma once

#include "install/admin/admin.h"

namespace kz7 {

// Writes a key with everything below it, or without a name everything; one state of the store.
Answer showKeysJson(Admin& admin, const std::string& key);

}  // namespace kz7
