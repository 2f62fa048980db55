// The installer runtime's ports of a machine.
#pragma once

#include "install/platform/platform.h"
#include "install/runtime/ure.h"

namespace kz7 {

inline RuntimePorts portsOf(IPlatform& platform, IInstallerSession* session = nullptr) {
    return {platform.files(),
            platform.processes(),
            platform.threads(),
            platform.console(),
            platform.terminal(),
            platform.host(),
            session};
}

}  // namespace kz7
