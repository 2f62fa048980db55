// The custom-action library of somebody else's package: it loads kz7actions64.dll from the path that it is told, calls
// it by its C names and writes what it saw to the installer's log, in lines that begin with "probe".
#include <windows.h>
// The types above first.
#include <msi.h>
#include <msiquery.h>

#include <algorithm>
#include <cstdarg>
#include <cstdio>
#include <string>
#include <vector>

#include "install/actions/kz7actions.h"

namespace {

constexpr char kSavedProperties[] = "\\SOFTWARE\\NVQ\\KZ7\\TEMP\\PROPERTIES95";
constexpr DWORD kWhole = 1024;  // enough for what was saved
constexpr DWORD kRoom = 4096;   // and for whatever the tests set
constexpr char kGuard = '#';

std::string ownProperty(MSIHANDLE installation, const char* name) {
    std::string value(kRoom, '\0');
    DWORD size = kRoom;
    value.resize(MsiGetPropertyA(installation, name, value.data(), &size) == ERROR_SUCCESS ? size : 0);
    return value;
}

// What the action is told: the path of the library and names of properties, between semicolons. An immediate action
// has no data of its own.
std::vector<std::string> told(MSIHANDLE installation) {
    const std::string given = ownProperty(installation, "CustomActionData");
    const std::string data = given.empty() ? ownProperty(installation, "PROBE_DATA") : given;
    std::vector<std::string> words;
    for (std::size_t at = 0; at <= data.size();) {
        const std::size_t end = std::min(data.find(';', at), data.size());
        words.push_back(data.substr(at, end - at));
        at = end + 1;
    }
    return words;
}

class Probe {
public:
    explicit Probe(MSIHANDLE installation) : installation_(installation), names_(told(installation)) {
        const HMODULE library = LoadLibraryA(names_.front().c_str());
        isLoaded = library != nullptr && resolve(library, "iMsiGetProperty", getProperty_) &&
                   resolve(library, "iMsiSetProperty", setProperty_) &&
                   resolve(library, "iSubstituteCopyName", substitute_);
        if (!isLoaded) {
            tell("cannot use '%s': error %lu", names_.front().c_str(), GetLastError());
        }
        names_.erase(names_.begin());
    }

    bool isLoaded;

    const std::vector<std::string>& names() const { return names_; }

    void tellKey() const {
        const std::string path = ownProperty(installation_, "UserSID") + kSavedProperties;
        HKEY key = nullptr;
        const LSTATUS status = RegOpenKeyExA(HKEY_USERS, path.c_str(), 0, KEY_READ, &key);
        if (status == ERROR_SUCCESS) {
            RegCloseKey(key);
        }
        tell("opening the key: status %ld", status);
    }

    void tellProperty(const std::string& name, std::uint32_t room) const {
        std::string value(2 * kRoom, kGuard);
        std::uint32_t size = room;
        const std::uint32_t status = getProperty_(installation_, name.c_str(), value.data(), &size);
        const char* guards = value.find_first_not_of(kGuard, room) == std::string::npos ? "" : ", WRITTEN BEHIND IT";
        if (status == ERROR_SUCCESS) {
            tell("%s in %u: size %u, '%s'%s", name.c_str(), room, size, value.c_str(), guards);
        } else {
            // How large the hint is, is the installer's affair.
            tell("%s in %u: status %u, a %s size%s", name.c_str(), room, status, size > room ? "larger" : "smaller",
                 guards);
        }
    }

    void changeProperty(const std::string& name) const {
        tell("setting %s: status %u", name.c_str(), setProperty_(installation_, name.c_str(), "new"));
    }

    void tellSubstitution() const {
        const char path[] = "InstalledCopies\\$CurrentInstallationName$";
        char output[sizeof path];
        tell("substituted: %s", substitute_(path, "COPY1", sizeof output, output));
        tell("substituted without a buffer: %s", substitute_(path, "COPY2", 0, nullptr));
        tell("without room: %s", substitute_(path, "C", sizeof path - 1, output) == nullptr ? "null" : "a text");
        tell("without a copy: %s", substitute_(path, nullptr, 0, nullptr) == path ? "the text itself" : "another text");
    }

private:
    template <typename Function>
    static bool resolve(HMODULE library, const char* name, Function& function) {
        // By way of a function without arguments: an address has no type of its own.
        function = reinterpret_cast<Function>(reinterpret_cast<void (*)()>(GetProcAddress(library, name)));
        return function != nullptr;
    }

    const char* mode() const {
        if (MsiGetMode(installation_, MSIRUNMODE_ROLLBACK)) {
            return "rollback";
        }
        if (MsiGetMode(installation_, MSIRUNMODE_COMMIT)) {
            return "commit";
        }
        return MsiGetMode(installation_, MSIRUNMODE_SCHEDULED) ? "deferred" : "immediate";
    }

    __attribute__((format(gnu_printf, 2, 3))) void tell(const char* pattern, ...) const {
        std::string text(kRoom, '\0');
        std::va_list inserts;
        va_start(inserts, pattern);
        std::vsnprintf(text.data(), text.size(), pattern, inserts);
        va_end(inserts);
        const MSIHANDLE record = MsiCreateRecord(1);
        MsiRecordSetStringA(record, 1, (std::string("probe ") + mode() + ": " + text.c_str()).c_str());
        MsiProcessMessage(installation_, INSTALLMESSAGE_INFO, record);
        MsiCloseHandle(record);
    }

    MSIHANDLE installation_;
    std::vector<std::string> names_;
    decltype(&iMsiGetProperty) getProperty_ = nullptr;
    decltype(&iMsiSetProperty) setProperty_ = nullptr;
    decltype(&iSubstituteCopyName) substitute_ = nullptr;
};

template <typename Work>
UINT probe(MSIHANDLE installation, Work work) {
    const Probe probe(installation);
    if (!probe.isLoaded) {
        return ERROR_INSTALL_FAILURE;
    }
    work(probe);
    return ERROR_SUCCESS;
}

}  // namespace

extern "C" {

// Reads each property.
__declspec(dllexport) UINT probeRead(MSIHANDLE installation) {
    return probe(installation, [](const Probe& probe) {
        probe.tellKey();
        for (const std::string& name : probe.names()) {
            probe.tellProperty(name, kWhole);
        }
    });
}

// Reads each property and changes it: whoever reads the old value later has it from where it was saved.
__declspec(dllexport) UINT probeChange(MSIHANDLE installation) {
    return probe(installation, [](const Probe& probe) {
        for (const std::string& name : probe.names()) {
            probe.tellProperty(name, kRoom);
            probe.changeProperty(name);
            probe.tellProperty(name, kRoom);
        }
    });
}

// Reads a property into too little room, and calls what needs no installation.
__declspec(dllexport) UINT probeRoom(MSIHANDLE installation) {
    return probe(installation, [](const Probe& probe) {
        probe.tellProperty(probe.names().front(), 4);
        probe.tellSubstitution();
    });
}

__declspec(dllexport) UINT probeFail(MSIHANDLE) {
    return ERROR_INSTALL_FAILURE;
}

}  // extern "C"
