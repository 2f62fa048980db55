// The small ports in memory. Tests set up and read their public members.
#pragma once

#include <cstdio>
#include <map>
#include <string>
#include <vector>

#include "install/platform/console.h"
#include "install/platform/handle_table.h"
#include "install/platform/host_information.h"
#include "install/platform/library_loader.h"
#include "install/platform/registry_path.h"
#include "install/platform/terminal.h"
#include "install/platform/threads.h"

namespace kz7 {

class MemoryConsole final : public IConsole {
public:
    Status writeOutput(std::string_view text) override {
        output += text;
        both += text;
        return kSuccess;
    }
    Status writeError(std::string_view text) override {
        flush();
        error += text;
        both += text;
        return kSuccess;
    }
    Status flush() override {
        flushed = output.size();
        return kSuccess;
    }

    std::string output;
    std::string error;
    std::string both;         // in the order of the calls
    std::size_t flushed = 0;  // bytes of `output` that precede a child's output
};

// For flows whose lines nobody reads.
class SilentConsole final : public IConsole {
public:
    Status writeOutput(std::string_view) override { return kSuccess; }
    Status writeError(std::string_view) override { return kSuccess; }
    Status flush() override { return kSuccess; }
    bool isSilent() const override { return true; }
};

class MemoryDebugOutput final : public IDebugOutput {
public:
    void write(std::string_view text) override { messages.emplace_back(text); }

    std::vector<std::string> messages;
};

// A clock that does not advance.
class MemoryHost final : public IHostInformation {
public:
    Status localTime(TimeText form, Buffer& text) override {
        return giveName(form == TimeText::timeOfDay ? timeOfDay : dateAndZone, text);
    }
    Status operatingSystem(OperatingSystem& system) override {
        system = installed;
        return kSuccess;
    }

    OperatingSystem installed{"Memory", "1", "0"};
    std::string dateAndZone = "Tue Jan  2 03:04:05 2024 UTC";
    std::string timeOfDay = "03:04:05";
};

class MemoryTerminal final : public ITerminal {
public:
    Status readLine(Buffer& line) override {
        std::size_t taken = 0;
        const auto next = [&] { return taken < input.size() ? static_cast<unsigned char>(input[taken++]) : EOF; };
        const Status status = readLineOf(next, line);
        input.erase(0, taken);
        return status;
    }
    void endReading() override {}  // no read waits
    void keepLineFeeds(bool on) override { keepsLineFeeds = on; }
    TerminalView look(TerminalStream) override { return view; }
    void leaveInterruptsToOthers(bool on) override { leavesInterrupts = on; }

    std::string input;  // the rest of the input
    TerminalView view;
    bool keepsLineFeeds = false;
    bool leavesInterrupts = false;
};

// Threads that never run on their own: the function of a thread runs when the thread is waited for or closed, in the
// calling thread, so that tests always run in the same order.
class MemoryThreads final : public IThreads {
public:
    Status startThread(std::unique_ptr<ThreadStart>& record, std::uint32_t, std::uint32_t& id,
                       ThreadHandle& thread) override {
        thread = threads_.give(std::move(record));
        id = static_cast<std::uint32_t>(thread);
        return kSuccess;
    }
    Status waitThread(ThreadHandle thread) override {
        auto* const found = threads_.find(thread);
        if (found == nullptr) {
            return kInvalidHandle;
        }
        if (*found != nullptr) {
            ThreadStart::run(found->release());
        }
        return kSuccess;
    }
    Status closeThread(ThreadHandle thread) override {
        const Status status = waitThread(thread);
        threads_.close(thread);
        return status;
    }

    std::size_t openHandles() const { return threads_.size(); }

private:
    HandleTable<ThreadHandle, std::unique_ptr<ThreadStart>> threads_;  // null: it has run
};

// Entry points of this program, by the path of their library and their name.
class MemoryLibraryLoader final : public ILibraryLoader {
public:
    using Entries = std::map<std::string, LibraryFunction>;

    Status load(std::string_view path, LibraryHandle& library) override {
        const auto found = libraries.find(std::string(path));
        if (found == libraries.end()) {
            return kModuleNotFound;
        }
        library = loaded.give(&found->second);
        return kSuccess;
    }
    Status resolve(LibraryHandle library, std::string_view name, LibraryFunction& function) override {
        const Entries* const* const open = loaded.find(library);
        if (open == nullptr) {
            return kInvalidHandle;
        }
        const auto entry = (*open)->find(std::string(name));
        if (entry == (*open)->end()) {
            return kProcedureNotFound;
        }
        function = entry->second;
        return kSuccess;
    }
    Status free(LibraryHandle library) override { return loaded.close(library) ? kSuccess : kInvalidHandle; }

    std::map<std::string, Entries> libraries;           // by path
    HandleTable<LibraryHandle, const Entries*> loaded;  // and not freed yet
};

}  // namespace kz7
