// The custom actions. Each call builds what it needs and leaves nothing behind: the installer loads the library anew
// for every action, other libraries keep it.
#include <algorithm>
#include <cstring>
#include <functional>
#include <memory>
#include <new>

#include "install/actions/kz7actions.h"
#include "install/platform/encoding.h"
#include "install/platform/installer_session.h"
#include "install/platform/platform.h"
#include "install/runtime/installer_properties.h"
#include "install/runtime/observers/display_observer.h"
#include "install/runtime/observers/observers_end.h"
#include "install/runtime/runtime_ports.h"
#include "install/src/registry/copy_name.h"

namespace kz7 {
namespace {

constexpr char kResponseFile[] = "RSP_FILE_PATH";
constexpr char kMessageFile[] = "KZ7_MESSAGES";
constexpr std::uint32_t kMostCharacters = 1 << 20;  // of a value that is read

// One call: this machine, the installation, and an engine whose log is the installer's.
class ActionCall {
public:
    explicit ActionCall(std::uint32_t installation)
        : platform_(hostPlatform({.program = "kz7actions64", .ownProcess = false})),
          session_(hostInstallerSession(installation)),
          engine_(portsOf(*platform_, session_.get())),
          at_{*session_, platform_->registry(), engine_},
          display_(at_) {
        // Without memory for an observer the action does its work unobserved.
        if (URELogObserver* log = URELogObserver::getInstance(engine_); log != nullptr) {
            engine_.registerObserver(*log, Takes::everything);
        }
        engine_.registerObserver(display_);
    }

    const Installation& at() const { return at_; }

    void readMessages() { readNamedFile(kMessageFile, &URE::readMessages); }
    void readResponses() { readNamedFile(kResponseFile, &URE::readResponses); }

    // Runs the work of an action that changes the registry, as a task with that description.
    Status runTask(std::uint32_t description, Status (*work)(const Installation&)) {
        constexpr std::int32_t kTask = 1;
        const std::string_view text = engine_.messages.plainText(description);
        engine_.startTask(0, kTask, true, text);
        const Status status = work(at_);
        engine_.endTask(kTask, true, text);
        const Status kept = platform_->registry().commit();
        return status != kSuccess ? status : kept;
    }

private:
    // Reads a file that a property names. The installer is asked, not the saved values: the user can write those.
    void readNamedFile(const char* property, Status (URE::*read)(std::string_view, std::string_view)) {
        TextBuffer<kPropertySize> path;
        const Status status = session_->getProperty(property, path);
        traceProperty(at_, "iMsiGetProperty", property, status);
        if (status == kSuccess && !path.text().empty()) {
            (engine_.*read)(property, path.text());
        }
    }

    std::unique_ptr<IPlatform> platform_;
    std::unique_ptr<IInstallerSession> session_;
    URE engine_;
    ObserversEnd observersEnd_;
    Installation at_;
    UREDisplayObserverWI display_;
};

// Nothing is thrown into the installer.
template <typename Work>
std::uint32_t call(std::uint32_t installation, Work work) {
    try {
        ActionCall action(installation);
        return work(action);
    } catch (const std::bad_alloc&) {
        return kNoMemory;
    } catch (...) {
        return kGeneralFailure;
    }
}

// An argument of a caller, whose texts are in the active code page; a null one stays null.
class Argument {
public:
    explicit Argument(const char* narrow) : isNull_(narrow == nullptr), text_(textFromNarrow(isNull_ ? "" : narrow)) {}

    const char* get() const { return isNull_ ? nullptr : text_.c_str(); }
    const std::string& text() const { return text_; }

private:
    bool isNull_;
    std::string text_;
};

// As many characters of a text as fit into that many bytes of the code page.
std::string narrowCut(std::string_view text, std::size_t most) {
    std::string narrow;
    while (!text.empty()) {
        std::string_view rest = text;
        char32_t character = 0;
        rest.remove_prefix(takeUtf8(rest, character) ? 0 : 1);
        const std::string next = narrowFromText(text.substr(0, text.size() - rest.size()));
        if (narrow.size() + next.size() > most) {
            break;
        }
        narrow += next;
        text = rest;
    }
    return narrow;
}

// A property in the code page; `characters` is the room for the first attempt.
Status readWhole(const std::function<Status(Buffer&)>& read, std::uint32_t characters, std::string& narrow) {
    for (;; characters *= 2) {
        std::string room(std::size_t{kBytesOfCharacter} * characters, '\0');
        Buffer value(room.data(), static_cast<std::uint32_t>(room.size()), characters);
        const Status status = read(value);
        if (status == kSuccess) {
            narrow = narrowFromText(value.view());
        }
        if (status != kMoreData || characters >= kMostCharacters) {
            return status;
        }
    }
}

// Reads a property into a caller's buffer: the code page decides whether it fits and what its size is.
Status readNarrow(const Installation& at, const char* name, char* buffer, std::uint32_t& size) {
    std::string narrow;
    const std::uint32_t room = std::clamp<std::uint32_t>(size, kPropertySize, kMostCharacters);
    const auto needed = [&narrow] { return narrow.size() + (narrow.ends_with('\0') ? 0 : 1); };
    Status status = readWhole([&](Buffer& value) { return readProperty(at, name, value); }, room, narrow);
    if (status == kSuccess && needed() > size) {
        // A saved value that does not fit counts as not saved.
        status = readWhole([&](Buffer& value) { return at.session.getProperty(name, value); }, room, narrow);
    }
    if (status != kSuccess) {
        return status;
    }
    if (needed() > size) {
        size = static_cast<std::uint32_t>(needed());
        return kMoreData;
    }
    size = static_cast<std::uint32_t>(narrow.size());
    narrow.copy(buffer, narrow.size());
    if (!narrow.ends_with('\0')) {
        buffer[narrow.size()] = '\0';
    }
    return kSuccess;
}

// As the runtime's: sizes are those of the code page, and a text without a change is the caller's own.
const char* substituteNarrow(const char* text, const Argument& copyName, std::uint32_t outputSize, char* output) {
    static std::string shared;
    if (outputSize != 0 && (output == nullptr || std::strlen(text) + 1 > outputSize)) {
        return nullptr;
    }
    const Argument given(text);
    const char* substituted = iSubstituteCopyName(given.get(), copyName.get(), 0, nullptr);
    const bool same = substituted == given.get();
    if (outputSize != 0) {
        const std::string narrow = same ? text : narrowCut(substituted, outputSize - 1);
        output[narrow.copy(output, outputSize - 1)] = '\0';
    } else if (!same) {
        shared = narrowFromText(substituted);
    }
    return same ? text : outputSize != 0 ? output : shared.c_str();
}

}  // namespace
}  // namespace kz7

using kz7::ActionCall;
using kz7::Argument;

extern "C" {

std::uint32_t iSavePropertiesForDeferred(std::uint32_t installation) {
    return kz7::call(installation, [](ActionCall& action) {
        action.readMessages();
        action.readResponses();
        return action.runTask(kz7::kSavingMessage, kz7::iSavePropertiesForDeferred);
    });
}

std::uint32_t iDeleteSavedProperties(std::uint32_t installation) {
    return kz7::call(installation, [](ActionCall& action) {
        action.readMessages();
        return action.runTask(kz7::kDeletingMessage, kz7::iDeleteSavedProperties);
    });
}

std::uint32_t iMsiGetProperty(std::uint32_t installation, const char* name, char* buffer, std::uint32_t* size) {
    return kz7::call(installation, [&](ActionCall& action) {
        const Argument named(name);
        const bool isWhole = name != nullptr && buffer != nullptr && size != nullptr;
        const kz7::Status status = isWhole ? kz7::readNarrow(action.at(), named.get(), buffer, *size)
                                           : kz7::iMsiGetProperty(action.at(), named.get(), buffer, size);
        kz7::traceProperty(action.at(), "iMsiGetProperty", named.text(), status);
        return status;
    });
}

std::uint32_t iMsiSetProperty(std::uint32_t installation, const char* name, const char* value) {
    return kz7::call(installation, [&](ActionCall& action) {
        const Argument named(name);
        const kz7::Status status = kz7::iMsiSetProperty(action.at(), named.get(), Argument(value).get());
        kz7::traceProperty(action.at(), "iMsiSetProperty", named.text(), status);
        return status;
    });
}

const char* iSubstituteCopyName(const char* text, const char* copyName, std::uint32_t outputSize, char* output) {
    try {
        return text != nullptr ? kz7::substituteNarrow(text, Argument(copyName), outputSize, output) : nullptr;
    } catch (...) {
        return nullptr;
    }
}

}  // extern "C"
