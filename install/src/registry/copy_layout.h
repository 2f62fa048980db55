// The paths of the product's keys below HKEY_LOCAL_MACHINE. The 32-bit view is addressed by its literal path, never by
// a view flag.
#pragma once

#include <string_view>

namespace kz7::layout {

// clang-format off
inline constexpr std::string_view kProduct           = "SOFTWARE\\NVQ\\KZ7";
inline constexpr std::string_view kBackup            = "SOFTWARE\\NVQ\\KZ7BackupV8";
inline constexpr std::string_view kComponents        = "SOFTWARE\\NVQ\\KZ7\\Components";
inline constexpr std::string_view kCurrentVersion    = "SOFTWARE\\NVQ\\KZ7\\CurrentVersion";
inline constexpr std::string_view kCopies            = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies";
inline constexpr std::string_view kCopies32          = "SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies";
inline constexpr std::string_view kCopy              = "SOFTWARE\\NVQ\\KZ7\\InstalledCopies\\$CurrentInstallationName$";
inline constexpr std::string_view kCopy32            = "SOFTWARE\\Wow6432Node\\NVQ\\KZ7\\InstalledCopies\\$CurrentInstallationName$";
// clang-format on

inline constexpr std::string_view kPathName = "KZ7 Path Name";                // a copy's install location
inline constexpr std::string_view kVersion9Marker = "MULTI_VERSION_SUPPORT";  // a value of a copy's components
inline constexpr std::string_view kVersion8Copy = "KZ7V8";  // the name of a version-8 installation in lists of copies

}  // namespace kz7::layout
