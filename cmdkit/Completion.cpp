// Shell completion scripts generated from the command tree. The tree's words, options and
// option values are written into the script as tables, so completing a word never runs brixcli.
#include <algorithm>
#include <boost/algorithm/string/replace.hpp>
#include <cctype>
#include <cstdio>
#include <ostream>

#include "Internal.h"
#include "cmdkit/Cli.h"
#include "cmdkit/ConstraintRule.h"

namespace CmdKit::AutoCli {

namespace {

struct GlobalOption {
    std::string word;
    std::string description;
    bool takesValue = false;
    std::vector<std::string> values;
    bool beforePathOnly = false;
};

// The options RunCli takes on the line; one without a list of values takes a file name.
std::vector<GlobalOption> GlobalOptions() {
    return {
        {"--help", "Print the help of the path", false, {}},
        {"-h", "Print the help of the path", false, {}},
        {"--list-commands", "List every command below the path", false, {}},
        {"--formatter", "Output format", true, Detail::FormatterNames()},
        {"--completion", "Print a shell completion script", true, CompletionShells()},
        {"--reference", "Print the command reference in Markdown", false, {}},
        {"--batch", "Run the command lines of a file, - for standard input", true, {}, true},
        {"--stop-on-error", "With --batch: stop after the first failing line", false, {}, true},
        {"--version", "Print the version", false, {}},
        {"--verbose", "With --version: list the plug-ins loaded", false, {}},
    };
}

using Table = std::vector<std::pair<std::string, std::string>>;

// The tree flattened into lookup tables. A node's key is the program name followed by its path
// words; an option's key is its command's key, a space and the option word. Lists hold one
// word a line.
struct Tables {
    Table children;           // namespace key -> its child words
    Table options;            // command key -> its option words, long then short
    Table flags;              // option key of an option that takes no value -> "1"
    Table freeText;           // option key of an unconstrained string option -> "1"
    Table values;             // option key -> the values it accepts, when they are a fixed list
    Table descriptions;       // node key, option key or "<option key>=<value>" -> one-line summary
    std::string globals;      // the global options taken anywhere
    std::string rootGlobals;  // those taken only before a path
    Table globalValues;       // global option word -> its values
};

std::string Lines(const std::vector<std::string>& words) {
    std::string text;
    for (const auto& word : words) {
        if (!text.empty()) text += '\n';
        text += word;
    }
    return text;
}

// The first sentence of a description, on one line, short enough to sit beside a word.
std::string Summary(const std::string& text) {
    std::string line = text.substr(0, text.find('\n'));
    if (auto end = line.find(". "); end != std::string::npos) line.erase(end);
    while (!line.empty() && (line.back() == '.' || line.back() == ' ')) line.pop_back();
    constexpr size_t kMax = 80;
    if (line.size() > kMax) {
        auto cut = line.rfind(' ', kMax - 3);
        line = line.substr(0, cut == std::string::npos ? kMax - 3 : cut) + "...";
    }
    return line;
}

void AddCommand(CommandSpec& command, const std::string& key, Tables& tables) {
    std::vector<std::string> words;
    for (const auto& parameter : command.GetInputSpec()->GetParameters()) {
        std::vector<std::string> spellings = {"--" + parameter->GetName()};
        if (!parameter->GetShortName().empty())
            spellings.push_back("-" + parameter->GetShortName());
        std::vector<std::string> values;
        const auto& constraint = parameter->GetConstraint();
        const auto* rule =
            constraint ? CallSpec::FindConstraintRule(constraint->GetType()) : nullptr;
        const auto choices = rule ? rule->Values(*constraint)
                                  : std::vector<CallSpec::ParameterConstraint::EnumValue>();
        if (parameter->GetType() == CallSpec::PARAM_BOOL) {
            values = {"true", "false", "yes", "no", "1", "0"};
        } else {
            for (const auto& entry : choices) values.push_back(entry.value);
        }
        const bool freeText = !constraint && (parameter->GetType() == CallSpec::PARAM_STRING ||
                                              parameter->GetType() == CallSpec::PARAM_STRING_LIST);
        const std::string summary =
            Summary(Detail::ExpandEnumPlaceholders(*parameter, parameter->GetDescription(), " "));
        for (const auto& spelling : spellings) {
            const std::string optionKey = key + " " + spelling;
            words.push_back(spelling);
            if (parameter->GetType() == CallSpec::PARAM_FLAG)
                tables.flags.emplace_back(optionKey, "1");
            if (freeText) tables.freeText.emplace_back(optionKey, "1");
            if (!values.empty()) tables.values.emplace_back(optionKey, Lines(values));
            if (!summary.empty()) tables.descriptions.emplace_back(optionKey, summary);
            for (const auto& entry : choices) {
                if (entry.description.empty()) continue;
                tables.descriptions.emplace_back(optionKey + "=" + entry.value,
                                                 Summary(entry.description));
            }
        }
    }
    // Long options first: they are what the user usually looks for.
    std::stable_partition(words.begin(), words.end(),
                          [](const std::string& word) { return word.rfind("--", 0) == 0; });
    tables.options.emplace_back(key, Lines(words));
}

void AddNode(NamespaceNode& node, const std::string& key, Tables& tables) {
    if (!node.GetDescription().empty()) {
        tables.descriptions.emplace_back(key, Summary(node.GetDescription()));
    }
    if (node.GetType() == NodeType::Command) {
        AddCommand(dynamic_cast<CommandSpec&>(node), key, tables);
        return;
    }
    tables.children.emplace_back(key, Lines(node.GetNamespaceNodeNames()));
    const auto names = node.GetNamespaceNodeNames();
    const auto children = node.GetNamespaceNodes();
    for (size_t i = 0; i < children.size(); ++i) {
        AddNode(*children[i], key + " " + names[i], tables);
    }
}

Tables Flatten(NamespaceNode& root, const std::string& program) {
    Tables tables;
    AddNode(root, program, tables);
    std::vector<std::string> globals, rootGlobals;
    for (const auto& option : GlobalOptions()) {
        (option.beforePathOnly ? rootGlobals : globals).push_back(option.word);
        tables.descriptions.emplace_back(option.word, option.description);
        if (option.takesValue) tables.globalValues.emplace_back(option.word, Lines(option.values));
    }
    tables.globals = Lines(globals);
    tables.rootGlobals = Lines(rootGlobals);
    return tables;
}

// A word both shells read back unchanged: $'...' with escapes.
std::string Quote(const std::string& text) {
    std::string quoted = "$'";
    for (unsigned char c : text) {
        switch (c) {
            case '\\':
                quoted += "\\\\";
                break;
            case '\'':
                quoted += "\\'";
                break;
            case '\n':
                quoted += "\\n";
                break;
            case '\t':
                quoted += "\\t";
                break;
            default:
                if (c < 0x20 || c == 0x7f) {
                    char escaped[8];
                    std::snprintf(escaped, sizeof escaped, "\\x%02x", c);
                    quoted += escaped;
                } else {
                    quoted += static_cast<char>(c);
                }
        }
    }
    return quoted + "'";
}

void WriteBashTable(std::ostream& out, const std::string& name, const Table& table) {
    out << "declare -gA " << name << "=(\n";
    for (const auto& [key, value] : table)
        out << "    [" << Quote(key) << "]=" << Quote(value) << '\n';
    out << ")\n";
}

void WriteZshTable(std::ostream& out, const std::string& name, const Table& table) {
    out << "typeset -gA " << name << '\n' << name << "=(\n";
    for (const auto& [key, value] : table)
        out << "    " << Quote(key) << ' ' << Quote(value) << '\n';
    out << ")\n";
}

template <class WriteTable>
void WriteTables(std::ostream& out, const std::string& program, const Tables& tables,
                 WriteTable writeTable) {
    const std::string prefix = "_" + program + "_";
    writeTable(out, prefix + "children", tables.children);
    writeTable(out, prefix + "options", tables.options);
    writeTable(out, prefix + "flags", tables.flags);
    writeTable(out, prefix + "free_text", tables.freeText);
    writeTable(out, prefix + "values", tables.values);
    writeTable(out, prefix + "descriptions", tables.descriptions);
    writeTable(out, prefix + "global_values", tables.globalValues);
}

// The shell functions below are written for a program named brixcli: each "brixcli" in them
// (the command completed, its functions, tables and keys) stands for the program's name.
std::string ForProgram(const char* functions, const std::string& program) {
    return boost::algorithm::replace_all_copy(std::string(functions), "brixcli", program);
}

// Completion for bash (4.2 or later). The words before the cursor are walked from the root:
// path words descend, option words are skipped with their value word. Readline splits
// "--name=value" at '='; the pieces are joined again first.
constexpr const char* kBashFunctions = R"BASH(
# Whether the list $1 (one word a line) holds the word $2.
_brixcli_has() {
    [[ $'\n'$1$'\n' == *$'\n'"$2"$'\n'* ]]
}

# Adds to COMPREPLY, after the prefix $3, each line of $2 that starts with $1.
_brixcli_add() {
    local line
    while IFS= read -r line; do
        [[ -n $line && $line == "$1"* ]] && COMPREPLY+=("$3$line")
    done <<<"$2"
}

# Whether node $1 is a command with the option word $2.
_brixcli_is_option() {
    [[ -n ${_brixcli_options[$1]+set} ]] && _brixcli_has "${_brixcli_options[$1]}" "$2"
}

# Whether option $2 at node $1 takes the next word as its value.
_brixcli_takes_value() {
    if _brixcli_is_option "$1" "$2"; then
        [[ -z ${_brixcli_flags["$1 $2"]+set} ]]
        return
    fi
    [[ -n ${_brixcli_global_values[$2]+set} ]]
}

# Sets `values` to the values option $2 at node $1 accepts; false when they are no fixed list.
# Returns 2 when the value is free text (a file name, say).
_brixcli_values_of() {
    local key="$1 $2"
    if _brixcli_is_option "$1" "$2"; then
        [[ -n ${_brixcli_free_text[$key]+set} ]] && return 2
        [[ -n ${_brixcli_values[$key]+set} ]] || return 1
        values=${_brixcli_values[$key]}
        return 0
    fi
    [[ -n ${_brixcli_global_values[$2]+set} ]] || return 1
    values=${_brixcli_global_values[$2]}
    [[ -n $values ]] || return 2
}

_brixcli() {
    COMPREPLY=()
    local key=brixcli word cur= split= pending= values option prefix i=1 found
    local -a words=()
    while ((i < COMP_CWORD)); do
        word=${COMP_WORDS[i]}
        if [[ $word == -* && ${COMP_WORDS[i + 1]-} == "=" ]]; then
            if ((i + 1 == COMP_CWORD)); then
                cur="$word=" split=1
                break
            elif ((i + 2 == COMP_CWORD)); then
                cur="$word=${COMP_WORDS[i + 2]}" split=1
                break
            fi
            words+=("$word=${COMP_WORDS[i + 2]}")
            i=$((i + 3))
            continue
        fi
        words+=("$word")
        i=$((i + 1))
    done
    [[ -z $split ]] && cur=${COMP_WORDS[COMP_CWORD]-}

    for word in "${words[@]}"; do
        if [[ -n $pending ]]; then
            pending=
            continue
        fi
        if [[ $word == -* ]]; then
            [[ $word != *=* ]] && _brixcli_takes_value "$key" "$word" && pending=$word
            continue
        fi
        if [[ -n ${_brixcli_children[$key]+set} ]]; then
            _brixcli_has "${_brixcli_children[$key]}" "$word" || return 0
            key+=" $word"
        fi
    done

    if [[ -n $pending || $cur == -*=* ]]; then
        option=${pending:-${cur%%=*}}
        [[ -z $pending ]] && cur=${cur#*=}
        [[ -z $pending && -z $split ]] && prefix="$option="
        _brixcli_values_of "$key" "$option"
        found=$?
        if ((found == 0)); then
            _brixcli_add "$cur" "$values" "$prefix"
        elif ((found == 2)) && [[ -z $prefix ]]; then
            compopt -o default 2>/dev/null
        fi
        return 0
    fi
    if [[ -n ${_brixcli_options[$key]+set} ]]; then
        if [[ $cur == -* ]]; then
            _brixcli_add "$cur" "${_brixcli_options[$key]}" ""
            _brixcli_add "$cur" "$_brixcli_globals" ""
        elif [[ -z $cur ]]; then
            _brixcli_add "" "${_brixcli_options[$key]}" ""
        fi
    elif [[ $cur == -* ]]; then
        _brixcli_add "$cur" "$_brixcli_globals" ""
        [[ $key == brixcli ]] && _brixcli_add "$cur" "$_brixcli_root_globals" ""
    else
        _brixcli_add "$cur" "${_brixcli_children[$key]-}" ""
    fi
    return 0
}

complete -F _brixcli brixcli
)BASH";

// Completion for zsh. _brixcli_candidates holds the logic and no completion-system calls, so it
// can be run on its own; _brixcli hands its answer to the completion system.
constexpr const char* kZshFunctions = R"ZSH(
# Whether the list $1 (one word a line) holds the word $2.
_brixcli_has() {
    local -a lines
    lines=("${(@f)1}")
    (( ${lines[(Ie)$2]} ))
}

# Whether node $1 is a command with the option word $2.
_brixcli_is_option() {
    (( ${+_brixcli_options[$1]} )) && _brixcli_has "${_brixcli_options[$1]}" "$2"
}

# Whether option $2 at node $1 takes the next word as its value.
_brixcli_takes_value() {
    local key="$1 $2"
    if _brixcli_is_option "$1" "$2"; then
        (( ! ${+_brixcli_flags[$key]} ))
        return
    fi
    (( ${+_brixcli_global_values[$2]} ))
}

# Sets `values` to the values option $2 at node $1 accepts; false when they are no fixed list.
# Returns 2 when the value is free text (a file name, say).
_brixcli_values_of() {
    local key="$1 $2"
    if _brixcli_is_option "$1" "$2"; then
        (( ${+_brixcli_free_text[$key]} )) && return 2
        (( ${+_brixcli_values[$key]} )) || return 1
        values=${_brixcli_values[$key]}
        return 0
    fi
    (( ${+_brixcli_global_values[$2]} )) || return 1
    values=${_brixcli_global_values[$2]}
    [[ -n $values ]] || return 2
}

# Appends to `reply` each word of the list $1 as "word:summary", the summary found under the
# description key $2 followed by the word.
_brixcli_describe() {
    local word summary
    for word in "${(@f)1}"; do
        [[ -n $word ]] || continue
        summary=${_brixcli_descriptions[$2$word]-}
        reply+=("${word//:/\\:}${summary:+:$summary}")
    done
}

# Completes the last of the given words, which are the words after the program name. Sets
# REPLY to what is offered (commands, options, values, files, or empty for nothing) and
# `reply` to the candidates as "word:summary".
_brixcli_candidates() {
    local key=brixcli word pending= cur=${argv[-1]} option values found
    reply=()
    REPLY=
    for word in "${(@)argv[1,-2]}"; do
        if [[ -n $pending ]]; then
            pending=
            continue
        fi
        if [[ $word == -* ]]; then
            [[ $word != *=* ]] && _brixcli_takes_value "$key" "$word" && pending=$word
            continue
        fi
        if (( ${+_brixcli_children[$key]} )); then
            _brixcli_has "${_brixcli_children[$key]}" "$word" || return 0
            key+=" $word"
        fi
    done

    if [[ -n $pending || $cur == -*=* ]]; then
        option=${pending:-${cur%%=*}}
        _brixcli_values_of "$key" "$option"
        found=$?
        if (( found == 0 )); then
            REPLY=values
            if _brixcli_is_option "$key" "$option"; then
                _brixcli_describe "$values" "$key $option="
            else
                _brixcli_describe "$values" "$option="
            fi
        elif (( found == 2 )); then
            REPLY=files
        fi
        return 0
    fi
    if (( ${+_brixcli_options[$key]} )); then
        if [[ $cur == -* || -z $cur ]]; then
            REPLY=options
            _brixcli_describe "${_brixcli_options[$key]}" "$key "
            [[ $cur == -* ]] && _brixcli_describe "$_brixcli_globals" ""
        fi
    elif [[ $cur == -* ]]; then
        REPLY=options
        _brixcli_describe "$_brixcli_globals" ""
        [[ $key == brixcli ]] && _brixcli_describe "$_brixcli_root_globals" ""
    else
        REPLY=commands
        _brixcli_describe "${_brixcli_children[$key]-}" "$key "
    fi
    return 0
}

_brixcli() {
    local -a reply
    local REPLY
    _brixcli_candidates "${(@)words[2,CURRENT]}"
    case $REPLY in
        (commands) _describe -t commands 'brixcli command' reply ;;
        (options) _describe -t options 'option' reply ;;
        (values) compset -P '-*='; _describe -t values 'value' reply ;;
        (files) compset -P '-*='; _files ;;
    esac
}

if [[ ${zsh_eval_context[-1]-} == loadautofunc ]]; then
    _brixcli "$@"
else
    compdef _brixcli brixcli
fi
)ZSH";

}  // namespace

const std::vector<std::string>& CompletionShells() {
    static const std::vector<std::string> shells = {"bash", "zsh"};
    return shells;
}

void WriteCompletionScript(NamespaceNode& root, const std::string& shell, std::ostream& out,
                           const Program& program) {
    const std::string& name = program.name;
    if (name.empty() || !std::all_of(name.begin(), name.end(),
                                     [](unsigned char c) { return std::isalnum(c) || c == '_'; })) {
        throw CmdKitException("No completion for the program name " + name +
                              ": letters, digits and _ only");
    }
    const Tables tables = Flatten(root, name);
    if (shell == "bash") {
        out << "# bash completion for " << name << ", generated by `" << name
            << " --completion bash`.\n";
        WriteTables(out, name, tables, WriteBashTable);
        out << "declare -g _" << name << "_globals=" << Quote(tables.globals) << '\n';
        out << "declare -g _" << name << "_root_globals=" << Quote(tables.rootGlobals) << '\n';
        out << ForProgram(kBashFunctions, name);
    } else if (shell == "zsh") {
        out << "#compdef " << name << "\n# zsh completion for " << name << ", generated by `"
            << name << " --completion zsh`.\n";
        WriteTables(out, name, tables, WriteZshTable);
        out << "typeset -g _" << name << "_globals=" << Quote(tables.globals) << '\n';
        out << "typeset -g _" << name << "_root_globals=" << Quote(tables.rootGlobals) << '\n';
        out << ForProgram(kZshFunctions, name);
    } else {
        throw CmdKitException("No completion for the shell " + shell);
    }
}

}  // namespace CmdKit::AutoCli
