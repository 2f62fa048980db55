// Response files: what an unattended installation is told, as lines NAME = value. Lines that begin with '*' or
// ';' are comments. A value in quotation marks keeps its blanks, a doubled mark in it stands for one.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "install/platform/file_system.h"
#include "install/platform/status.h"

namespace kz7 {

struct ResponseKeyword {
    std::string name;
    std::string value;
    std::uint32_t line = 0;  // of the file, from 1
};

struct ResponseFault {
    std::uint32_t line = 0;
    std::string_view reason;
};

// All keywords in file order, one that comes twice too. kInvalidData: `fault` names the first bad line, and
// nothing is given.
Status parseResponseFile(std::string_view file, std::vector<ResponseKeyword>& keywords, ResponseFault& fault);

// The same for a file; whatever else went wrong with it is its own status and line 0.
Status ureReadRspFile(IFileSystem& files, std::string_view path, std::vector<ResponseKeyword>& keywords,
                      ResponseFault& fault);

}  // namespace kz7
