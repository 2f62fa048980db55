// Lines of the C library's standard input, on every host alike.
#pragma once

#include "install/platform/buffer.h"
#include "install/platform/status.h"

namespace kz7 {

// As ILineChannel::readLine().
Status readStandardLine(Buffer& line);

}  // namespace kz7
