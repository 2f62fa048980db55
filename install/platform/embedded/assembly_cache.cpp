#include "install/platform/embedded/ports.h"

#include <filesystem>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

#include "install/platform/assembly_records.h"
#include "install/platform/embedded/paths.h"

namespace kz7 {
namespace {

// The assembly cache of a host without the .NET framework: the provider files in a location's bin folder, as records in
// the registry store.
class EmbeddedAssemblyCache final : public IAssemblyCache {
public:
    EmbeddedAssemblyCache(IRegistryStore& registry, std::string stateDirectory)
        : registry_(registry), stateDirectory_(std::move(stateDirectory)) {}

    Status deregisterProviders(std::string_view level) override { return dropProviders(registry_, level); }

    Status registerProviders(std::string_view location, std::string_view level,
                             FrameworkGenerations generations) override {
        const std::string folder = hostPath(std::string(location) + "\\bin", stateDirectory_);
        std::vector<std::string> files;
        // A folder that is missing or cannot be read has no providers.
        namesIn(folder, files);
        std::erase_if(files, [&](const std::string& file) {
            std::error_code ignored;
            return !isProviderFile(file) || !std::filesystem::is_regular_file(folder + '/' + file, ignored);
        });
        return recordProviders(registry_, location, level, generations, files);
    }

private:
    IRegistryStore& registry_;
    std::string stateDirectory_;
};

}  // namespace

std::unique_ptr<IAssemblyCache> embeddedAssemblies(IRegistryStore& registry, std::string stateDirectory) {
    return std::make_unique<EmbeddedAssemblyCache>(registry, std::move(stateDirectory));
}

}  // namespace kz7
