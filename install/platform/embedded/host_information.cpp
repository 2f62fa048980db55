#include <sys/utsname.h>

#include <cstdlib>
#include <ctime>

#include "install/platform/embedded/ports.h"

namespace kz7 {
namespace {

class EmbeddedHost final : public IHostInformation {
public:
    Status localTime(TimeText form, Buffer& text) override {
        const std::time_t now = std::time(nullptr);
        std::tm parts{};
        return localtime_r(&now, &parts) == nullptr ? kGeneralFailure : giveTime(parts, form, text);
    }

    Status operatingSystem(OperatingSystem& system) override {
        utsname found{};
        if (uname(&found) == -1) {
            return kGeneralFailure;
        }
        system = {found.sysname, found.version, found.release};
        return kSuccess;
    }
};

}  // namespace

std::string environmentText(const char* name) {
    const char* const value = std::getenv(name);
    return value == nullptr ? std::string{} : value;
}

std::unique_ptr<IHostInformation> embeddedHost() {
    return std::make_unique<EmbeddedHost>();
}

}  // namespace kz7
