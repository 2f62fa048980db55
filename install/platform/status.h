// Status numbers: what every operation of the system returns. 0 is success; the platform's own error
// numbers pass through unchanged, the installer runtime's codes lie between 5000 and 6100.
#pragma once

#include <cstdint>

namespace kz7 {

using Status = std::uint32_t;

// clang-format off
inline constexpr Status kSuccess                 = 0;
inline constexpr Status kFileNotFound            = 2;     // also: no such key, no such value
inline constexpr Status kPathNotFound            = 3;     // a folder of a path is missing
inline constexpr Status kTooManyOpenFiles        = 4;
inline constexpr Status kAccessDenied            = 5;     // also: a key that still has subkeys, a right the handle lacks
inline constexpr Status kInvalidHandle           = 6;
inline constexpr Status kInvalidData             = 13;    // a file with invalid content
inline constexpr Status kOutOfMemory             = 14;
inline constexpr Status kWriteFault              = 29;    // writing to a stream failed
inline constexpr Status kReadFault               = 30;    // a list could not be read completely
inline constexpr Status kGeneralFailure          = 31;    // a device or resource failed in a way that has no number
inline constexpr Status kEndOfFile               = 38;    // nothing is left to read
inline constexpr Status kFileExists              = 80;
inline constexpr Status kInvalidParameter        = 87;
inline constexpr Status kBrokenPipe              = 109;   // every write end of a pipe that is read is closed
inline constexpr Status kDiskFull                = 112;
inline constexpr Status kCallNotImplemented      = 120;
inline constexpr Status kInvalidName             = 123;   // a service name that no service can have
inline constexpr Status kModuleNotFound          = 126;   // no library of that path, or one that cannot be loaded
inline constexpr Status kProcedureNotFound       = 127;   // the library has no such entry point
inline constexpr Status kBadPathname             = 161;
inline constexpr Status kTooManyThreads          = 164;   // the host cannot start another thread
inline constexpr Status kBusy                    = 170;   // the store stayed locked by another writer
inline constexpr Status kFilenameExceedsRange    = 206;   // a path that does not fit its buffer
inline constexpr Status kPipeClosing             = 232;   // the read end of a pipe that is written is closed
inline constexpr Status kMoreData                = 234;
inline constexpr Status kWaitTimedOut            = 258;   // what is waited for has not ended
inline constexpr Status kNoMoreItems             = 259;
inline constexpr Status kBadDirectory            = 267;   // a program's working directory is not a directory
inline constexpr Status kOperationAborted        = 995;   // another thread ended the operation
inline constexpr Status kBadKey                  = 1010;
inline constexpr Status kCannotOpen              = 1011;  // the store cannot be opened or made
inline constexpr Status kRegistryCorrupt         = 1015;
inline constexpr Status kRegistryIoFailed        = 1016;
inline constexpr Status kNotRegistryFile         = 1017;
inline constexpr Status kKeyDeleted              = 1018;  // the key behind a handle is gone or marked for deletion
inline constexpr Status kServiceAlreadyRunning   = 1056;
inline constexpr Status kServiceDoesNotExist     = 1060;
inline constexpr Status kServiceTakesNoControl   = 1061;  // it is starting or stopping
inline constexpr Status kServiceNotActive        = 1062;
inline constexpr Status kServiceMarkedForDelete  = 1072;
inline constexpr Status kServiceExists           = 1073;
inline constexpr Status kDuplicateServiceName    = 1078;
inline constexpr Status kRevisionMismatch        = 1306;  // the store was written by a newer program
inline constexpr Status kUnknownFeature          = 1606;  // the installation has no feature of that name
inline constexpr Status kBadQuery                = 1615;  // the installation's database has no such table
inline constexpr Status kActionNotCalled         = 1626;  // the installation has no action of that name
inline constexpr Status kFunctionFailed          = 1627;  // the installer allows it at another time only
inline constexpr Status kNoMemory                = 5002;  // out of memory in the installer runtime
inline constexpr Status kNullArgument            = 5003;
inline constexpr Status kNoProgramType           = 5005;  // a command that names no file of a known program type
inline constexpr Status kBufferTooSmall          = 5006;
inline constexpr Status kNoInstallerSession      = 5011;  // also: no message of that number
inline constexpr Status kMissingItem             = 5021;  // the installer runtime's "not found"
inline constexpr Status kNotExecuted             = 5030;  // a run that was waited for before it was executed
inline constexpr Status kNoSystemFile            = 5056;  // the instance has no profile folder or no system file
inline constexpr Status kParameterNotSet         = 5057;
inline constexpr Status kParameterSet            = 5058;  // a message
inline constexpr Status kGlobalVariableFailed    = 5059;
inline constexpr Status kNotForInstance          = 5061;  // a variable that is for all instances only
inline constexpr Status kUnknownVariable         = 5062;
inline constexpr Status kExitCodeUnavailable     = 5082;  // also: the program could not be started
inline constexpr Status kInstanceVariableFailed  = 5094;
inline constexpr Status kThreadStartFailed       = 5111;
inline constexpr Status kNotGlobal               = 5339;  // a variable that is for single instances only
inline constexpr Status kVariableSet             = 5512;  // a message
inline constexpr Status kNoInstallationDatabase  = 6045;
inline constexpr Status kVariableNotThere        = 0x870F0104;  // the profile registry has no such variable
inline constexpr Status kFailed                  = 0xFFFFFFFF;  // -1: a failure without details
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
