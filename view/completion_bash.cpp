#include <string_view>

#include "view/completion.hpp"

namespace view {

namespace {

std::string joined(const std::vector<std::string>& words, std::string_view between) {
    std::string text;
    for (const std::string& word : words) {
        text += (text.empty() ? "" : std::string(between)) + word;
    }
    return text;
}

// What stands in front of a cursor as a pattern of bash's case: the command and each name of the option.
std::string pattern(const CompletedCommand& command, const CompletedValue& option) {
    std::vector<std::string> cases;
    for (const std::string& name : option.names) {
        cases.push_back('"' + command.name + ' ' + name + '"');
    }
    return joined(cases, " | ");
}

// What is completed behind an option that takes a value; all else is a file.
void writeValue(std::ostream& output, const CompletedCommand& command, const CompletedValue& option) {
    output << "        " << pattern(command, option) << ")";
    if (option.words.empty()) {
        output << " return 0 ;;\n";
        return;
    }
    output << "\n            words=(" << joined(option.words, " ") << ")\n";
    if (option.isList) {
        output << "            prefix=${current%\"${current##*,}\"}\n"
                  "            compopt -o nospace 2>/dev/null # of bash 4\n";
    }
    output << "            ;;\n";
}

// The words that may stand anywhere else behind a command: its options, and its arguments where they are
// words.
void writeCommand(std::ostream& output, const CompletedCommand& command, std::vector<std::string> arguments) {
    std::vector<std::string> options;
    for (const CompletedValue& option : command.options) {
        options.push_back(option.names.back()); // the long one
    }
    for (const CompletedValue& argument : command.arguments) {
        arguments.insert(arguments.end(), argument.words.begin(), argument.words.end());
    }
    output << "        \"" << command.name << " -\"*) words=(" << joined(options, " ") << ") ;;\n";
    if (!arguments.empty()) {
        output << "        \"" << command.name << " \"*) words=(" << joined(arguments, " ") << ") ;;\n";
    }
}

} // namespace

void writeBashCompletion(std::ostream& output, const std::vector<CompletedCommand>& commands) {
    std::vector<std::string> names;
    for (const CompletedCommand& command : commands) {
        if (!command.name.empty()) {
            names.push_back(command.name);
        }
    }
    output
        << R"(# bash completion for morvane-view, as `morvane-view completion bash` writes it. Where it has no words, bash
# completes the names of files, as it knows how to quote them.
_morvane_view() {
    local current=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD - 1]} command="" prefix="" words=() word
    COMPREPLY=()
    if [[ $current == = ]]; then # of --option=value
        current=""
    elif [[ $before == = ]]; then
        before=${COMP_WORDS[COMP_CWORD - 2]}
    fi
    for word in "${COMP_WORDS[@]:1:COMP_CWORD-1}"; do
        case $word in )"
        << joined(names, " | ") << R"() command=$word && break ;; esac
    done
    case "$command $before" in
)";
    for (const CompletedCommand& command : commands) {
        for (const CompletedValue& option : command.options) {
            if (!option.value.empty()) {
                writeValue(output, command, option);
            }
        }
    }
    output << R"(    esac
    [[ ${#words[@]} -gt 0 ]] || case "$command $current" in
)";
    for (const CompletedCommand& command : commands) {
        writeCommand(output, command, command.name.empty() ? names : std::vector<std::string>());
    }
    output << R"(    esac
    for word in "${words[@]}"; do
        [[ $word == "${current#"$prefix"}"* ]] && COMPREPLY+=("$prefix$word")
    done
    return 0
}
complete -o bashdefault -o default -F _morvane_view morvane-view
)";
}

} // namespace view
