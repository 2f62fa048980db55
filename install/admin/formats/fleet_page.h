// The machines of a fleet as one page: findings by kind, machines that differ from most, versions of each machine. The
// page has less than 5 MB whatever the facts are.
#pragma once

#include <string>

#include "install/admin/fleet.h"

namespace kz7 {

std::string fleetPage(const Fleet& fleet, const std::string& time);

}  // namespace kz7
