// The state that the subcommands of kz7admin share: the program's options, the open store and the output. Each
// subcommand is a pair of files with one function that adds it to the program.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "install/admin/formats/json_text.h"
#include "install/platform/platform.h"
#include "install/platform/text.h"
#include "install/src/registry/key_walk.h"

namespace kz7 {

// The exit status of a subcommand.
enum Answer : int {
    kAnswerYes = 0,
    kAnswerNo = 1,       // the result is empty, or a part of the work failed
    kAnswerFault = 2,    // an unusable store, file or command line
    kAnswerChanged = 3,  // done, and something changed; with --detailed-exitcode only
};

class Admin {
public:
    std::string storeDirectory;          // empty: the usual one
    std::vector<std::string> arguments;  // of this program
    std::function<int()> answer;         // runs the chosen subcommand; the exit code
    bool isJson = false;                 // --json: all output is for programs

    // Opens the ports, once. False, with a message: a store directory was given, and this machine's store is its
    // registry. `missingIsEmpty`: see PlatformOptions.
    bool open(bool readOnly, bool missingIsEmpty = false);

    // The same for a command that changes only what is there: false, with a message, without a store.
    bool openExisting(bool readOnly);

    // The options of every store that this program opens; each adds its own.
    PlatformOptions platformOptions();

    // Only after open().
    IPlatform& platform() { return *platform_; }
    IRegistryStore& registry() { return platform_->registry(); }

    // Describes the run that changes the store, for the history; `undoes` is the run that it takes back.
    void beginRun(bool startsPrograms = false, std::uint64_t undoes = 0);
    void endRun(int result);

    // With --json, writes the lines for standard error as one object.
    void endErrors(int exitCode);

    // The properties of standard output.
    TerminalView output() { return platform_->terminal().look(TerminalStream::output); }

    // Writes a key and its subkeys, or without a name everything, between a head and a tail. `append` formats each key;
    // a key that cannot be read is reported too. Reading::pages writes while it reads, so other programs may change the
    // store meanwhile; Reading::snapshot writes one state as a document.
    using Appender = std::function<void(const KeyRecord&, std::string&)>;
    enum class Reading { snapshot, pages };
    Answer showKeys(const std::string& key, std::string text, const Appender& append, std::string_view tail,
                    Reading reading);

    // Text for people, or a document for programs: UTF-8 or bytes on every host.
    enum class Form { text, document };

    // Writes to standard output; names the store on standard error before the first text for people.
    Answer show(std::string_view text, Form form = Form::text);

    // The name of the open store, with its note.
    std::string storeLine();

    // Writes a document, whose outermost object is still open, to standard output.
    Answer writeJson(JsonWriter& json);

    // One line on standard error, in any state of this object.
    void tell(std::string_view message);
    Answer no(std::string_view message);
    Answer fault(std::string_view message);

    // The same with a status, unless the platform has reported a fault of the store.
    Answer storeFault(std::string_view what, Status status);

    // Writes to standard output and reports a failure. Succeeds if the reader has closed the pipe. Ends a read
    // transaction first, so that a slow reader blocks no checkpoint.
    Answer write(std::string_view text, Form form = Form::text);

    // Writes a whole file that the command line names, which is `what`: under another name first, never through a link,
    // never over a file of a store. checkFile() tells beforehand whether the name can be used.
    Answer checkFile(std::string_view what, const std::string& file);
    Answer findFile(std::string_view what, const std::string& file, std::string& path);  // the same with the path
    Answer writeFile(std::string_view what, const std::string& file, std::string_view content, bool replace);

private:
    struct Showing;

    Answer selectKeys(const std::string& key, std::vector<KeyStart>& starts);
    Status showKey(const KeyRecord& record, Showing& showing);

    std::unique_ptr<IPlatform> platform_;
    bool readOnly_ = false;
    bool storeTold_ = false;
    std::string told_;               // with --json
    Status storeStatus_ = kSuccess;  // of the last fault of the store
    bool readerGone_ = false;
};

// Why a file cannot be written.
std::string reasonOf(Status status);

}  // namespace kz7
