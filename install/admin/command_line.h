// The command line of the program: a thin layer over CLI11, so that only two sources compile that library's templates.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <type_traits>
#include <vector>

#include "install/admin/admin.h"

namespace CLI {
class App;
class Option;
}  // namespace CLI

namespace kz7 {

// An option or an argument of a command. A copy names the same one.
class Option {
public:
    explicit Option(CLI::Option* option) : option_(option) {}

    Option& isRequired();
    Option& isOneOf(const std::vector<std::string>& words);
    Option& isFileName();  // an empty name is an error
    Option& isSplitAt(char separator);

    // `fault` returns what is wrong with an argument, or an empty text.
    Option& check(const std::function<std::string(const std::string&)>& fault);

    Option& excludes(const Option& other);
    Option& needs(const Option& other);

private:
    friend class Command;

    CLI::Option* option_;
};

// What a command takes, for programs that complete its command line.
struct OptionShape {
    std::vector<std::string> names;  // the last one is the longest; an argument has one, without hyphens
    std::string description;
    std::vector<std::string> choices;  // of the value, if only some words are possible
    bool isArgument = false;
    bool takesValue = false;
    bool isRepeated = false;
};
struct CommandShape {
    std::string name;
    std::string description;
    std::vector<OptionShape> options;
    std::vector<CommandShape> commands;
};

// The program or one of its commands. A copy names the same one; a variable that receives a value must live until the
// command line was read.
class Command {
public:
    explicit Command(CLI::App& app) : app_(&app) {}

    Command add(const std::string& name, const std::string& description);
    void describe(const std::string& footer);

    Option flag(const std::string& name, bool& value, const std::string& description);
    Option text(const std::string& name, std::string& value, const std::string& description);
    Option texts(const std::string& name, std::vector<std::string>& values, const std::string& description);
    Option json(Admin& admin, const std::string& description = "Write JSON for programs");
    Option number(const std::string& name, std::uint64_t& value, const std::string& description);

    CommandShape shape() const;

    void needsOneOf(const Option& one, const Option& other);

    // What follows the first argument belongs to the arguments, whatever it looks like.
    void endsWithArguments();

    // Has `function` answer for the command, with options that live as long as the program.
    template <class Result, class Argument>
    std::decay_t<Argument>& answerWith(Admin& admin, Result (*function)(Admin&, Argument)) {
        auto options = std::make_shared<std::decay_t<Argument>>();
        answerWith(admin, [&admin, options, function] { return static_cast<int>(function(admin, *options)); });
        return *options;
    }

    // The same with the options of another command.
    template <class Options>
    void answerWith(Admin& admin, Answer (*function)(Admin&, const Options&), const Options& options) {
        answerWith(admin, [&admin, &options, function] { return static_cast<int>(function(admin, options)); });
    }

    void answerWith(Admin& admin, const std::function<int()>& function);

private:
    CLI::App* app_;
};

}  // namespace kz7
