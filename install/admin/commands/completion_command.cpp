#include <algorithm>
#include <set>

#include "install/admin/commands/commands.h"
#include "install/admin/findings.h"
#include "install/platform/text.h"
#include "install/src/uselvlkz7reg.h"

namespace kz7 {
namespace {

struct CompletionOptions {
    std::string shell;
    const Command* program = nullptr;
};

struct Completer {
    std::string_view name;     // of an option or an argument
    std::string_view sources;  // of its value; a second word is for the arguments after it
};

// Words separated by commas, or @ and the name of what the shells look up. What an option allows is not repeated here.
// clang-format off
constexpr std::array kCompleters = {
    Completer{"--copy",          "@copies"},
    Completer{"--fleet",         "@files"},
    Completer{"--from",          "@files"},
    Completer{"--log",           "@files"},
    Completer{"--on",            "@directories"},
    Completer{"--output",        "@files"},
    Completer{"--response-file", "@files"},
    Completer{"--store",         "@directories"},
    Completer{"A",               "@files"},
    Completer{"B",               "@files"},
    Completer{"FILE",            "@files"},
    Completer{"N",               "@runs"},
    Completer{"NAME",            "@copies"},
    Completer{"PREFIX",          "@prefixes"},
    Completer{"PROGRAM",         "@programs @files"},
};
// clang-format on

constexpr std::string_view kBash = R"sh(# Completions of kz7admin, printed by `kz7admin completion bash`.
_kz7admin_list() { # sources, separated by commas
    local source
    for source in ${1//,/ }; do
        case $source in
            @copies) mapfile -t -O ${#items[@]} items < <(command kz7admin "${store[@]}" copies --columns name --format tsv 2>/dev/null) ;;
            @prefixes) mapfile -t -O ${#items[@]} items < <(command kz7admin "${store[@]}" aliases 2>/dev/null | sed '1d; s/ .*//') ;;
            @runs) mapfile -t -O ${#items[@]} items < <(command kz7admin "${store[@]}" history 2>/dev/null | sed '1d; s/ .*//') ;;
            @files) compopt -o filenames && mapfile -t COMPREPLY < <(compgen -f -- "$word") ;;
            @directories) compopt -o filenames && mapfile -t COMPREPLY < <(compgen -d -- "$word") ;;
            @programs) mapfile -t COMPREPLY < <(compgen -c -- "$word") ;;
            *) items+=("$source") ;;
        esac
    done
}

_kz7admin() {
    local word last quote='' option='' ended='' command='' commands options values arguments index
    local line=$COMP_LINE words=() count=0 store=() items=() places
    for word in "${COMP_WORDS[@]:0:COMP_CWORD + 1}"; do # parts of words: bash splits them at ":" and "=", too
        if [[ ${#words[@]} == 0 || $line == [[:space:]]* ]]; then
            words+=("$word")
        elif [[ ${words[-1]} == --* && $word == = ]]; then
            words+=('')
        else
            words[-1]+=$word
        fi
        line=${line#*"$word"}
    done
    _kz7admin_shape ''
    for word in "${words[@]:1:${#words[@]} - 2}"; do
        if [[ -n $option ]]; then
            word=${word//[\"\'\\]/}
            [[ $option != --store ]] || store=(--store "${word/#\~\//$HOME/}")
            option=
        elif [[ -z $ended && $word == -- ]]; then
            ended=yes
        elif [[ -z $ended && $word == -* ]]; then
            [[ $values != *" $word="* ]] || option=$word
        elif [[ " $commands " == *" $word "* ]]; then
            command+=" $word"
            _kz7admin_shape "$command"
        else
            ((++count))
        fi
    done
    word=${words[-1]}
    last=${COMP_WORDS[COMP_CWORD]}
    [[ $last != [:=@]* ]] || last=
    if [[ $word == [\"\']* ]]; then
        quote=${word:0:1} word=${word:1} last=${last#[\"\']}
    fi
    COMPREPLY=()
    if [[ -n $option ]]; then
        places=${values#*" $option="}
        _kz7admin_list "${places%% *}"
    elif [[ -z $ended && $word == -* ]]; then
        _kz7admin_list "${options// /,}"
    else
        read -ra places <<<"$arguments"
        if [[ $arguments == *'... ' ]] && ((count > ${#places[@]} - 2)); then
            count=$((${#places[@]} - 2))
        fi
        _kz7admin_list "${places[count]:-}"
        ((count > 0)) || _kz7admin_list "${commands// /,}"
    fi
    for index in "${items[@]}"; do
        if [[ -z $quote ]]; then
            printf -v index %q "$index"
        elif [[ $index == *[\"\'\\\$\`!]* ]]; then
            continue
        fi
        [[ $index != "$word"* ]] || COMPREPLY+=("$index")
    done
    COMPREPLY=("${COMPREPLY[@]#"${word%"$last"}"}") # readline replaces the last part only
}

_kz7admin_shape() { # command
    case $1 in
)sh";

constexpr std::string_view kBashEnd = R"sh(    esac
}

complete -F _kz7admin kz7admin
)sh";

constexpr std::string_view kZsh = R"sh(#compdef kz7admin
# Completions of kz7admin, printed by `kz7admin completion zsh`.
_kz7admin_list() { # sources, separated by commas
    local source
    local -a found store=(${(Q)${(M)kz7_words:#--store=*}})
    local -i at=${kz7_words[(I)--store]}
    (( at == 0 )) || store=(--store ${${(Q)kz7_words[at + 1]}/#\~\//$HOME/})
    for source in ${(s:,:)1}; do
        case $source in
            @copies) found+=(${(f)"$(command kz7admin $store copies --columns name --format tsv 2>/dev/null)"}) ;;
            @prefixes) found+=(${${${(f)"$(command kz7admin $store aliases 2>/dev/null)"}[2,-1]}%% *}) ;;
            @runs) found+=(${${${(f)"$(command kz7admin $store history 2>/dev/null)"}[2,-1]}%% *}) ;;
            @files) _files ;;
            @directories) _files -/ ;;
            @programs) _command_names -e ;;
            *) found+=($source) ;;
        esac
    done
    compadd -a found
}

_kz7admin_first() { # sources besides the commands
    _describe command subcommands
    _kz7admin_list "${1:-}"
}

)sh";

constexpr std::string_view kZshEnd = R"sh(
if [[ $funcstack[1] == _kz7admin ]]; then _kz7admin "$@"; else compdef _kz7admin kz7admin; fi
)sh";

template <class Texts>
std::string joined(const Texts& texts, std::string_view separator) {
    std::string result;
    for (const auto& text : texts) {
        result.append(result.empty() ? "" : separator).append(text);
    }
    return result;
}

// The sources of a value, one word for each place.
std::string sourcesOf(const OptionShape& option) {
    const std::string& name = option.names.back();
    if (!option.choices.empty()) {
        return joined(option.choices, ",");
    }
    if (name == "COMMAND") {
        return joined(toolOptions(), ",") + " @copies @directories";
    }
    if (name == "KIND") {
        std::set<std::string_view> kinds;
        for (const FindingKind& kind : findingKinds()) {
            if (!kind.group.empty()) {
                kinds.insert({kind.group, kind.name});
            }
        }
        return joined(kinds, ",") + ",@copies";
    }
    const auto* const row = std::find_if(kCompleters.begin(), kCompleters.end(),
                                         [&](const Completer& completer) { return completer.name == name; });
    return row == kCompleters.end() ? std::string{} : std::string(row->sources);
}

// The options of a command and those of the program, which every command takes.
std::vector<OptionShape> optionsOf(const CommandShape& command, const std::vector<OptionShape>& common) {
    std::vector<OptionShape> options = command.options;
    for (const OptionShape& option : common) {
        const bool isOwn = std::any_of(command.options.begin(), command.options.end(),
                                       [&](const OptionShape& own) { return own.names.back() == option.names.back(); });
        if (!isOwn) {
            options.push_back(option);
        }
    }
    return options;
}

std::vector<std::string> namesOf(const std::vector<CommandShape>& commands) {
    std::vector<std::string> names;
    names.reserve(commands.size());
    for (const CommandShape& command : commands) {
        names.push_back(command.name);
    }
    return names;
}

void appendBash(const CommandShape& command, const std::string& path, const std::vector<OptionShape>& common,
                std::string& script) {
    std::vector<std::string> names;
    std::string values = " ";
    std::string arguments;
    for (const OptionShape& option : optionsOf(command, common)) {
        if (option.isArgument) {
            const std::string sources = sourcesOf(option);
            arguments += (sources.empty() ? "," : sources) + (option.isRepeated ? " ... " : " ");
            continue;
        }
        for (const std::string& name : option.names) {
            names.push_back(name);
            values += option.takesValue ? name + '=' + sourcesOf(option) + ' ' : std::string{};
        }
    }
    script +=
        compose("        '%s')\n            options='%s' values='%s'\n            arguments='%s' commands='%s' ;;\n",
                {path, joined(names, " "), values, arguments, joined(namesOf(command.commands), " ")});
    for (const CommandShape& below : command.commands) {
        appendBash(below, path + ' ' + below.name, common, script);
    }
}

// A text in quotation marks; the characters that separate the parts of a rule are escaped.
std::string zshQuoted(std::string_view text, std::string_view special) {
    std::string quoted;
    for (const char character : text) {
        quoted += special.find(character) != std::string_view::npos ? "\\" : "";
        quoted += character == '\'' ? std::string("'\\''") : std::string(1, character);
    }
    return quoted;
}

void appendZshOption(const OptionShape& option, std::string& rules) {
    const std::string sources = sourcesOf(option);
    const std::string description = zshQuoted(option.description, "[]:\\");
    for (const std::string& name : option.names) {
        rules += compose(" \\\n        '%s%s[%s]", {name, option.takesValue ? "=" : "", description});
        rules += option.takesValue ? compose(":%s: _kz7admin_list %s'", {name.substr(2), sources}) : std::string("'");
    }
}

void appendZshArgument(const OptionShape& argument, std::size_t& place, std::string& rules) {
    std::string sources = sourcesOf(argument);
    do {
        const std::string source = sources.substr(0, sources.find(' '));
        sources.erase(0, source.size() + 1);
        const bool isLast = argument.isRepeated && sources.empty();
        rules += compose(" \\\n        '%s:%s: _kz7admin_list %s'",
                         {isLast ? "*" : std::to_string(++place), argument.names.back(), source});
    } while (!sources.empty());
}

void appendZsh(const CommandShape& command, const std::string& function, const std::vector<OptionShape>& common,
               std::string& script) {
    std::string rules;
    std::string sources;
    std::size_t place = 0;
    for (const OptionShape& option : optionsOf(command, common)) {
        if (!option.isArgument) {
            appendZshOption(option, rules);
        } else if (command.commands.empty()) {
            appendZshArgument(option, place, rules);
        } else {
            sources = sourcesOf(option);
        }
    }
    script += function + "() {\n";
    if (command.commands.empty()) {
        script += "    _arguments -S" + rules + "\n}\n";
        return;
    }
    script += "    local state line context curcontext=$curcontext\n    local -A opt_args\n    local -a subcommands=(";
    for (const CommandShape& below : command.commands) {
        script += "\n        '" + below.name + ':' + zshQuoted(below.description, "\\") + '\'';
    }
    script += compose(
        ")\n%s    _arguments -C%s \\\n        '1: : _kz7admin_first %s' '*:: :->rest'\n"
        "    [[ $state != rest ]] || (( ! $+functions[%s_$words[1]] )) || %s_$words[1]\n}\n",
        {command.name == "kz7admin" ? "    local -a kz7_words=(\"${words[@]}\")\n" : "", rules, sources, function,
         function});
    for (const CommandShape& below : command.commands) {
        appendZsh(below, function + '_' + below.name, common, script);
    }
}

Answer printCompletion(Admin& admin, const CompletionOptions& options) {
    if (!admin.open(true)) {
        return kAnswerFault;
    }
    const CommandShape program = options.program->shape();
    std::string script(options.shell == "bash" ? kBash : kZsh);
    if (options.shell == "bash") {
        appendBash(program, "", program.options, script);
        script += kBashEnd;
    } else {
        appendZsh(program, "_kz7admin", program.options, script);
        script += kZshEnd;
    }
    if (admin.isJson) {
        JsonWriter json = beginDocument();
        json.field("shell", options.shell).field("script", script);
        return admin.writeJson(json);
    }
    return admin.write(script, Admin::Form::document);
}

}  // namespace

void addCompletionCommand(Command& program, Admin& admin) {
    auto command = program.add("completion", "Print the completions for a shell");
    auto& options = command.answerWith(admin, printCompletion);
    options.program = &program;
    command.text("SHELL", options.shell, "bash or zsh").isRequired().isOneOf({"bash", "zsh"});
    command.json(admin);
}

}  // namespace kz7
