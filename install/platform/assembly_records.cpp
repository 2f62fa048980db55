#include "install/platform/assembly_records.h"

#include "install/platform/text.h"

namespace kz7 {
namespace {

constexpr std::uint32_t kRecordNameRoom = 1024;  // a file name of 255 bytes and a level of 255 fit

// What a record's name says between its file and the number of its generation.
std::string recordLevel(std::string_view level) {
    return compose(",level=\"%s\",generation=\"", {level});
}

bool isProviderFile(std::string_view file) {
    constexpr std::string_view kBegin = "kz7nmp";
    constexpr std::string_view kEnd = ".dll";
    return file.size() >= kBegin.size() + kEnd.size() && equalsIgnoreCase(file.substr(0, kBegin.size()), kBegin) &&
           equalsIgnoreCase(file.substr(file.size() - kEnd.size()), kEnd);
}

}  // namespace

std::vector<std::string> providerFiles(IFileSystem& files, std::string_view location, std::string& folder) {
    folder = compose(location.ends_with('\\') ? "%sbin\\" : "%s\\bin\\", {location});
    std::vector<std::string> names;
    files.listFiles(folder, names);
    std::erase_if(names, [](const std::string& name) { return !isProviderFile(name); });
    return names;
}

Status AssemblyRecords::registerProviders(std::string_view location, std::string_view level,
                                          FrameworkGenerations generations) {
    std::string folder;
    const std::vector<std::string> files = providerFiles(files_, location, folder);
    if (files.empty()) {
        return kSuccess;
    }
    OwnedKey key(registry_);
    Status status = registry_.createKey(KeyHandle::localMachine, kAssemblyRecords, {}, kKeyFull, key.receive());
    if (!succeeded(status)) {
        return status;
    }
    const std::string levelText = recordLevel(level);
    for (const std::string& file : files) {
        const std::string path = folder + file + '\0';
        for (const FrameworkGenerations generation : {kFramework2, kFramework4}) {
            if ((generations & generation) == 0) {
                continue;
            }
            const Status set =
                registry_.setValue(key.get(), compose("%s%s%u\"", {file, levelText, generation}), ValueType::sz, path);
            status = succeeded(status) ? set : status;
        }
    }
    return status;
}

Status AssemblyRecords::deregisterProviders(std::string_view level) {
    if (level.empty()) {
        return kSuccess;
    }
    OwnedKey key(registry_);
    Status status = registry_.openKey(KeyHandle::localMachine, kAssemblyRecords, kKeyFull, key.receive());
    if (!succeeded(status)) {
        return isNotFound(status) ? kSuccess : status;
    }
    std::vector<std::string> names;
    TextBuffer<kRecordNameRoom> name;
    const std::string levelText = recordLevel(level);
    std::uint32_t index = 0;
    while (succeeded(status = registry_.enumerateValue(key.get(), index, name, nullptr, nullptr))) {
        ++index;
        const std::string_view text = name.text();
        if (text.find(levelText) != std::string_view::npos) {
            names.emplace_back(text);
        }
    }
    status = isEndOfItems(status) ? kSuccess : status;
    for (const std::string& record : names) {
        const Status deleted = registry_.deleteValue(key.get(), record);
        status = succeeded(status) ? deleted : status;
    }
    return status;
}

}  // namespace kz7
