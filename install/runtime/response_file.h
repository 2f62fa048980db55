// Response files: the input of an unattended installation, as lines NAME = value. Lines that begin with '*' or ';' are
// comments. A value in quotation marks keeps its blanks; a doubled quotation mark in it is one quotation mark.
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
    std::uint32_t line = 0;  // 0: the file as a whole
    std::string_view reason;
};

inline constexpr std::string_view kUnreadableReason = "it cannot be read";
inline constexpr std::string_view kNoMemoryReason = "there is not enough memory";

// All keywords in file order, repeated ones too. On failure, kInvalidData or kNoMemory, `fault` has the first bad line
// and its reason, and `keywords` stays as it is.
Status parseResponseFile(std::string_view file, std::vector<ResponseKeyword>& keywords, ResponseFault& fault);

// The same for a file. A file that cannot be read gives the file system's status.
Status ureReadRspFile(IFileSystem& files, std::string_view path, std::vector<ResponseKeyword>& keywords,
                      ResponseFault& fault);

}  // namespace kz7
