#include "install/admin/command_line.h"

#include <CLI/CLI.hpp>

namespace kz7 {
namespace {

// The words of a description such as "TEXT:{native,32-bit}".
std::vector<std::string> choicesOf(const CLI::Option& option) {
    const std::string type = option.get_type_name();
    const std::size_t begin = type.find('{');
    const std::size_t end = type.find('}');
    return end == std::string::npos ? std::vector<std::string>{}
                                    : CLI::detail::split(type.substr(begin + 1, end - begin - 1), ',');
}

OptionShape shapeOf(const CLI::Option& option) {
    OptionShape shape{{}, option.get_description(), choicesOf(option), option.get_positional()};
    for (const std::string& name : option.get_snames()) {
        shape.names.push_back('-' + name);
    }
    for (const std::string& name : option.get_lnames()) {
        shape.names.push_back("--" + name);
    }
    if (shape.isArgument) {
        shape.names.push_back(option.get_name(true));
    }
    shape.takesValue = option.get_items_expected_max() > 0;
    shape.isRepeated = option.get_items_expected_max() > 1;
    return shape;
}

CommandShape shapeOf(const CLI::App& app) {
    CommandShape shape{app.get_name(), app.get_description(), {}, {}};
    for (const CLI::Option* const option : app.get_options()) {
        shape.options.push_back(shapeOf(*option));
    }
    for (const CLI::App* const command : app.get_subcommands([](const CLI::App*) { return true; })) {
        shape.commands.push_back(shapeOf(*command));
    }
    return shape;
}

}  // namespace

Option& Option::isRequired() {
    option_->required();
    return *this;
}

Option& Option::isOneOf(const std::vector<std::string>& words) {
    option_->check(CLI::IsMember(words));
    return *this;
}

Option& Option::isFileName() {
    return check([](const std::string& text) { return std::string(text.empty() ? "the name is empty" : ""); });
}

Option& Option::isSplitAt(char separator) {
    option_->delimiter(separator);
    return *this;
}

Option& Option::check(const std::function<std::string(const std::string&)>& fault) {
    option_->check(CLI::Validator(fault, {}));
    return *this;
}

Option& Option::excludes(const Option& other) {
    option_->excludes(other.option_);
    return *this;
}

Option& Option::needs(const Option& other) {
    option_->needs(other.option_);
    return *this;
}

Command Command::add(const std::string& name, const std::string& description) {
    app_->require_subcommand(0, 1);
    return Command(*app_->add_subcommand(name, description));
}

void Command::describe(const std::string& footer) {
    app_->footer(footer);
}

Option Command::flag(const std::string& name, bool& value, const std::string& description) {
    return Option(app_->add_flag(name, value, description));
}

Option Command::json(Admin& admin, const std::string& description) {
    return flag("--json", admin.isJson, description);
}

Option Command::text(const std::string& name, std::string& value, const std::string& description) {
    return Option(app_->add_option(name, value, description));
}

Option Command::texts(const std::string& name, std::vector<std::string>& values, const std::string& description) {
    return Option(app_->add_option(name, values, description));
}

Option Command::number(const std::string& name, std::uint64_t& value, const std::string& description) {
    // CLI11 itself takes "-1" as a very great number.
    return Option(app_->add_option(name, value, description)).check([](const std::string& text) {
        const bool isNumber = !text.empty() && text.find_first_not_of("0123456789") == std::string::npos;
        return std::string(isNumber && text.size() < 20 ? "" : "not a number");
    });
}

CommandShape Command::shape() const {
    return shapeOf(*app_);
}

void Command::needsOneOf(const Option& one, const Option& other) {
    app_->parse_complete_callback([first = one.option_, second = other.option_] {
        if (first->empty() && second->empty()) {
            throw CLI::RequiredError(first->get_name() + " or " + second->get_name());
        }
    });
}

void Command::endsWithArguments() {
    app_->positionals_at_end();
}

void Command::answerWith(Admin& admin, const std::function<int()>& function) {
    // The command below it, which is asked first, answers.
    app_->callback([&admin, function] {
        if (admin.answer == nullptr) {
            admin.answer = function;
        }
    });
}

}  // namespace kz7
