// The installer runtime's ports of a machine.
#pragma once

#include "install/platform/platform.h"
#include "install/runtime/ure.h"

namespace kz7 {

inline RuntimePorts portsOf(const Ports& ports, IInstallerSession* session = nullptr) {
    return {*ports.files, *ports.processes, *ports.threads, *ports.console, *ports.terminal, *ports.host, session};
}
inline RuntimePorts portsOf(const IPlatform& platform, IInstallerSession* session = nullptr) {
    return portsOf(platform.ports(), session);
}

}  // namespace kz7
