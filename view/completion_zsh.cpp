#include <string_view>

#include "view/completion.hpp"

namespace view {

namespace {

// A text in what _arguments and _describe take, in single quotes.
std::string escaped(std::string_view text) {
    std::string shown;
    for (const char c : text) {
        if (c == '\'') {
            shown += R"('\'')";
        } else {
            shown += std::string_view("[]:\\").find(c) == std::string_view::npos ? "" : "\\";
            shown += c;
        }
    }
    return shown;
}

// ":FILE:_files": what is taken and how it is completed.
std::string action(const CompletedValue& value) {
    std::string text = ':' + escaped(value.value) + ':';
    if (value.isFile) {
        return text + "_files";
    }
    if (value.words.empty()) {
        return text + ' ';
    }
    std::string words;
    for (const std::string& word : value.words) {
        words += ' ' + word;
    }
    return text +
           (value.isList ? " _values -s , " + escaped(value.value) + words : '(' + words.substr(1) + ')');
}

// "(-o --columns)": the names of an option, none of which is offered behind one of them.
std::string exclusion(const CompletedValue& option) {
    std::string names;
    for (const std::string& name : option.names) {
        names += (names.empty() ? "" : " ") + name;
    }
    return option.isRepeated ? "*" : '(' + names + ')';
}

void writeOption(std::ostream& output, std::string_view indent, const CompletedValue& option) {
    for (const std::string& name : option.names) {
        output << indent << '\'' << exclusion(option) << name;
        if (!option.value.empty()) {
            output << (name.starts_with("--") ? "=" : "+"); // the value behind it, or as the next word
        }
        output << '[' << escaped(option.description) << ']' << (option.value.empty() ? "" : action(option))
               << "' \\\n";
    }
}

void writeArguments(std::ostream& output, const CompletedCommand& command) {
    output << "                " << command.name << ")\n                    _arguments \\\n";
    for (const CompletedValue& option : command.options) {
        writeOption(output, "                        ", option);
    }
    for (const CompletedValue& argument : command.arguments) {
        output << "                        '" << (argument.isRepeated ? "*" : "") << action(argument)
               << "' \\\n";
    }
    output << "                        && result=0\n                    ;;\n";
}

} // namespace

void writeZshCompletion(std::ostream& output, const std::vector<CompletedCommand>& commands) {
    output << R"(#compdef morvane-view
# zsh completion for morvane-view, as `morvane-view completion zsh` writes it.
_morvane-view() {
    local curcontext=$curcontext context state state_descr line result=1
    typeset -A opt_args
    local -a commands
    commands=(
)";
    for (const CompletedCommand& command : commands) {
        if (!command.name.empty()) {
            output << "        '" << command.name << ':' << escaped(command.description) << "'\n";
        }
    }
    output << "    )\n    _arguments -C -A '-*' \\\n";
    for (const CompletedValue& option : commands.front().options) {
        writeOption(output, "        ", option);
    }
    output << R"(        '1: :->first' \
        '*:: :->rest' \
        && result=0
    case $state in
        first)
            _describe -t commands command commands && result=0
            _files && result=0
            ;;
        rest)
            case $words[1] in
)";
    for (const CompletedCommand& command : commands) {
        if (!command.name.empty()) {
            writeArguments(output, command);
        }
    }
    output << R"(            esac
            ;;
    esac
    return result
}
if [[ ${funcstack[1]} == _morvane-view ]]; then # loaded as a function when it is called first
    _morvane-view "$@"
else
    compdef _morvane-view morvane-view
fi
)";
}

} // namespace view
