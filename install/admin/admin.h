// What the subcommands of kz7admin share: the options of the program, the store that they open, and how they
// answer. A subcommand has a file pair of its own with one function that adds it to the program.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "install/admin/key_walk.h"
#include "install/platform/platform.h"
#include "install/platform/shown_text.h"

namespace kz7 {

// What a subcommand exits with.
enum Answer : int {
    kAnswerYes = 0,
    kAnswerNo = 1,     // what was asked for is not there
    kAnswerFault = 2,  // a store or a file that cannot be used, a command line that cannot be understood
};

class Admin {
public:
    std::string storeDirectory;      // empty: the usual one
    std::function<Answer()> answer;  // what the subcommand that was given does

    // Opens the ports once, for reading or also for writing. False, and told: this machine has no store of
    // another place.
    bool open(bool readOnly);

    // Those that were opened.
    IPlatform& platform() { return *platform_; }
    IRegistryStore& registry() { return platform_->registry(); }

    // Shows the named key with all below it, or without a name all there is to show, between a head and a
    // tail: `append` adds what a key looks like, also one that cannot be read, which is told. By pages it goes out
    // while it is read and others may write in between; a snapshot is a document.
    using Appender = std::function<void(const KeyRecord&, std::string&)>;
    enum class Reading { snapshot, pages };
    Answer showKeys(const std::string& key, std::string text, const Appender& append, std::string_view tail,
                    Reading reading);

    // Text for people, or what programs read: UTF-8 or bytes on every host.
    enum class Form { text, document };

    // Writes to standard output; the store it comes from is told on standard error, once.
    Answer show(std::string_view text, Form form = Form::text);

    // Which store was opened, and what to know about that.
    std::string storeLine();

    // One line on standard error.
    void tell(std::string_view message);
    Answer no(std::string_view message);
    Answer fault(std::string_view message);

    // The same for a status of the store, unless the store has told its fault already.
    Answer storeFault(std::string_view what, Status status);

    // Writes to standard output; a fault is told. A reader that is gone wants no more, which is no fault. A store that
    // is open for reading is not held meanwhile.
    Answer write(std::string_view text, Form form = Form::text);

private:
    Answer selectKeys(const std::string& key, std::vector<KeyStart>& starts);

    std::unique_ptr<IPlatform> platform_;
    bool readOnly_ = false;
    bool storeTold_ = false;
    bool readerGone_ = false;
};

}  // namespace kz7
