// Sets the variables and parameters of a response file for a copy. Progress and errors are written for a user or a
// front end, and all steps to a log.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "install/platform/platform.h"
#include "install/runtime/response_file.h"

namespace kz7 {

// The environment variable that names a file with the texts of another language.
inline constexpr const char* kMessagesVariable = "KZ7_MESSAGES";

struct ConfigurationRequest {
    std::string copy;
    std::string location;  // of the copy, one of the product's paths
    std::string instance;  // at most 8 characters; empty: all of the copy
    std::vector<ResponseKeyword> responses;
    std::string logFile;      // one of the product's paths; empty: no log
    std::string messageFile;  // one of the product's paths; empty: the built-in texts
    bool machine = false;     // speaks the progress protocol
};

struct ConfigurationOutcome {
    std::uint32_t set = 0;
    std::uint32_t notSet = 0;  // unknown names included
    Status kept = kSuccess;    // the status of committing the variables
};

ConfigurationOutcome runConfiguration(const Ports& ports, ConfigurationRequest request);

}  // namespace kz7
