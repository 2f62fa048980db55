#include "install/platform/embedded/assembly_cache.h"

#include <algorithm>
#include <filesystem>
#include <system_error>
#include <utility>
#include <vector>

#include "install/platform/assembly_records.h"
#include "install/platform/embedded/paths.h"

namespace kz7 {

EmbeddedAssemblyCache::EmbeddedAssemblyCache(IRegistryStore& registry, std::string stateDirectory)
    : registry_(registry), stateDirectory_(std::move(stateDirectory)) {}

Status EmbeddedAssemblyCache::deregisterProviders(std::string_view level) {
    return dropProviders(registry_, level);
}

Status EmbeddedAssemblyCache::registerProviders(std::string_view location, std::string_view level,
                                                FrameworkGenerations generations) {
    const std::string folder = hostPath(std::string(location) + "\\bin", stateDirectory_);
    std::vector<std::string> files;
    // A folder that is missing or cannot be read has nothing to register.
    std::error_code ignored;
    for (std::filesystem::directory_iterator entry(folder, ignored), end; entry != end; entry.increment(ignored)) {
        std::string file = entry->path().filename().string();
        if (isProviderFile(file) && entry->is_regular_file(ignored)) {
            files.push_back(std::move(file));
        }
    }
    std::sort(files.begin(), files.end());
    return recordProviders(registry_, location, level, generations, files);
}

}  // namespace kz7
