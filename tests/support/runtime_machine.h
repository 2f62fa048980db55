// The installer runtime on a machine in memory, with or without an installer session.
#pragma once

#include <gtest/gtest.h>

#include <array>
#include <ios>
#include <memory>
#include <sstream>
#include <string>
#include <utility>

#include "install/platform/memory/installer_session.h"
#include "install/platform/memory/platform.h"
#include "install/runtime/observers/observers_end.h"
#include "install/runtime/runtime_ports.h"
#include "install/runtime/ure.h"
#include "tests/support/intercepted_ports.h"

namespace kz7::test {

// The destructor releases the process-wide observers; nothing may be open after that.
class RuntimeMachine : public MemoryPlatform {
public:
    // An observer sees what the engine does, but no call of the machine's plain members.
    explicit RuntimeMachine(bool withSession = false, ICallObserver* observer = nullptr)
        : engine(enginePorts(withSession, observer)) {
        processes_.addProgram(kFolder, {});  // for its short form
        files_.add(std::string(kFolder) + "readme");
    }
    ~RuntimeMachine() override {
        { const ObserversEnd end; }
        EXPECT_EQ(files_.openFiles() + processes_.openHandles() + session.openHandles(), 0U);
        EXPECT_EQ(registry_.openHandles(), 0U);
    }
    RuntimeMachine(const RuntimeMachine&) = delete;
    RuntimeMachine& operator=(const RuntimeMachine&) = delete;

    URELogObserver& log() { return *URELogObserver::getInstance(engine); }

    // Opens the log and registers it.
    void openLog() {
        log().setLogFile(kLogFile);
        engine.registerObserver(log(), Takes::everything);
    }
    std::string logText() { return files_.content(kLogFile); }

    // The text that an action adds to the log.
    template <typename Action>
    std::string logged(Action action) {
        const std::size_t before = logText().size();
        action();
        return logText().substr(before);
    }

    // Raises a message that consists of a text.
    void say(std::uint32_t code, std::string_view text) {
        engine.message(code, kTextMessage, std::array<Insert, 1>{text});
    }

    // The messages of the session since the last call: "kind|field|field", a line for each.
    std::string shownInSession() {
        std::ostringstream text;
        for (const auto& message : std::exchange(session.messages, {})) {
            text << std::hex << message.kind;
            for (const std::string& field : message.fields) {
                text << '|' << field;
            }
            text << '\n';
        }
        return text.str();
    }

    static constexpr const char* kFolder = "C:\\Setup Logs\\";
    static constexpr const char* kLogFile = "C:\\Setup Logs\\setup.log";

    IInstallerSession& installer() {
        return intercepted_ ? static_cast<IInstallerSession&>(*interceptedSession_) : session;
    }

    MemoryInstallerSession session;

private:
    RuntimePorts enginePorts(bool withSession, ICallObserver* observer) {
        if (observer != nullptr) {
            intercepted_ = std::make_unique<InterceptedPorts>(ports_, *observer);
            interceptedSession_ = std::make_unique<InterceptedSession>(session, *observer);
            ports_ = intercepted_->ports();
        }
        return portsOf(*this, withSession ? &installer() : nullptr);
    }

    std::unique_ptr<InterceptedPorts> intercepted_;
    std::unique_ptr<InterceptedSession> interceptedSession_;

public:
    URE engine;
};

}  // namespace kz7::test
