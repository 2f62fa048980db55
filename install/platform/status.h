// Status numbers: what every operation of the system returns. 0 is success; the platform's own error
// numbers pass through unchanged, the installer runtime's codes lie between 5000 and 6100.
#pragma once

#include <cstdint>

namespace kz7 {

using Status = std::uint32_t;

// clang-format off
inline constexpr Status kSuccess                 = 0;
inline constexpr Status kFileNotFound            = 2;     // also: no such key, no such value
inline constexpr Status kAccessDenied            = 5;     // also: a key that still has subkeys, a right the handle lacks
inline constexpr Status kInvalidHandle           = 6;
inline constexpr Status kOutOfMemory             = 14;
inline constexpr Status kWriteFault              = 29;    // a stream does not take what is written
inline constexpr Status kInvalidParameter        = 87;
inline constexpr Status kDiskFull                = 112;
inline constexpr Status kCallNotImplemented      = 120;
inline constexpr Status kInvalidName             = 123;   // a service name that no service can have
inline constexpr Status kModuleNotFound          = 126;   // no library of that path, or one that cannot be loaded
inline constexpr Status kProcedureNotFound       = 127;   // the library has no such entry point
inline constexpr Status kBadPathname             = 161;
inline constexpr Status kBusy                    = 170;   // the store stayed locked by another writer
inline constexpr Status kFilenameExceedsRange    = 206;   // a path that does not fit its buffer
inline constexpr Status kMoreData                = 234;
inline constexpr Status kNoMoreItems             = 259;
inline constexpr Status kBadKey                  = 1010;
inline constexpr Status kCannotOpen              = 1011;  // the store cannot be opened or made
inline constexpr Status kRegistryCorrupt         = 1015;
inline constexpr Status kRegistryIoFailed        = 1016;
inline constexpr Status kNotRegistryFile         = 1017;
inline constexpr Status kKeyDeleted              = 1018;  // the key behind a handle is gone or marked for deletion
inline constexpr Status kServiceAlreadyRunning   = 1056;
inline constexpr Status kServiceDoesNotExist     = 1060;
inline constexpr Status kServiceNotActive        = 1062;
inline constexpr Status kServiceMarkedForDelete  = 1072;
inline constexpr Status kServiceExists           = 1073;
inline constexpr Status kDuplicateServiceName    = 1078;
inline constexpr Status kRevisionMismatch        = 1306;  // the store was written by a newer program
inline constexpr Status kMissingItem             = 5021;  // the installer runtime's "not there"
inline constexpr Status kFailed                  = 0xFFFFFFFF;  // -1: the alias rewrite says no more
// clang-format on

constexpr bool succeeded(Status status) {
    return status == kSuccess;
}
constexpr bool isNotFound(Status status) {
    return status == kFileNotFound;
}
constexpr bool isEndOfItems(Status status) {
    return status == kNoMoreItems;
}

}  // namespace kz7
