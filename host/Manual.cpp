#include "host/Manual.hpp"

#include <algorithm>
#include <iterator>
#include <sstream>
#include <string_view>

#include "host/console/ValueWords.hpp"

namespace velkor::host {

namespace {

using Commands = std::vector<CommandRegistry::CommandPtr>;

constexpr const char* commandForm = "-- COMMAND...";

std::string joined(const std::vector<std::string>& words, const char* separator) {
    std::string text;
    for (const auto& word : words) text += (text.empty() ? "" : separator) + word;
    return text;
}

std::string withBlank(const std::string& text) {
    return text.empty() ? "" : ' ' + text;
}

/// What a command takes, as help shows it; nothing if it is not known by name.
std::string argumentsOf(const Command& command) {
    return command.usage().arguments.empty() && command.usage().options.empty()
               ? ""
               : command.argumentText();
}

// ---- usage ----

std::string usageLines(const ProgramUsage& usage, const Commands& commands) {
    std::string text;
    for (const auto& option : usage.options) {
        for (const auto& name : option.names) text += name + withBlank(option.valueName) + '\n';
    }
    text += std::string(commandForm) + '\n';
    for (const auto& command : commands) {
        text += command->name() + withBlank(argumentsOf(*command)) + '\n';
    }
    return text;
}

// ---- man ----

// As ordinary text in the middle of a line.
std::string manText(std::string_view text) {
    std::string escaped;
    for (const char byte : text) {
        if (byte == '\\') {
            escaped += "\\e";
        } else if (byte == '-') {
            escaped += "\\-";
        } else if (byte == '\'') {
            escaped += "\\(aq";
        } else {
            escaped += byte;
        }
    }
    return escaped;
}

std::string bold(std::string_view text) {
    return "\\fB" + manText(text) + "\\fR";
}

std::string italic(std::string_view text) {
    return "\\fI" + manText(text) + "\\fR";
}

std::string manEntry(const std::string& heading, std::string_view text) {
    return ".TP\n" + heading + '\n' + manText(text) + '\n';
}

// Each line of `text` by itself.
std::string manLines(const std::string& text) {
    std::istringstream in(text);
    std::string lines;
    for (std::string line; std::getline(in, line);) {
        lines += line.empty() ? ".PP\n" : manText(line) + '\n';
    }
    return lines;
}

std::string optionHeading(const ProgramUsage::Option& option) {
    std::vector<std::string> names;
    for (const auto& name : option.names) names.push_back(bold(name));
    return joined(names, ", ") + (option.valueName.empty() ? "" : ' ' + italic(option.valueName));
}

std::string commandHeading(const Command& command) {
    const std::string arguments = argumentsOf(command);
    return bold(command.name()) + (arguments.empty() ? "" : ' ' + italic(arguments));
}

std::string commandText(const Command& command) {
    if (command.shortName() == command.name()) return command.description();
    return command.description() + " Short: " + std::string(command.shortName()) + '.';
}

std::string manPage(const ProgramUsage& usage, const Commands& commands) {
    std::string page =
        ".\\\" Made by velkor-config --manual man.\n"
        ".TH VELKOR\\-CONFIG 1 \"\" \"velkor " VELKOR_VERSION
        "\"\n"
        ".SH NAME\n"
        "velkor\\-config \\- look into a layered configuration, and change it\n"
        ".SH SYNOPSIS\n"
        "\\fBvelkor\\-config\\fR [\\fIOPTIONS\\fR] [\\fIFILE\\fR...] [\\fB\\-\\-\\fR "
        "\\fICOMMAND\\fR...]\n"
        ".SH DESCRIPTION\n";
    page += manLines(usage.description) + ".PP\n" + manLines(usage.notes) + ".SH OPTIONS\n";
    for (const auto& option : usage.options) page += manEntry(optionHeading(option), option.help);
    page += manEntry(bold("--") + ' ' + italic("COMMAND..."),
                     "Carry out one command, whose words are taken as they are.");
    page += ".SH COMMANDS\nA command may be called by the last word of its name.\n";
    for (const auto& command : commands) {
        page += manEntry(commandHeading(*command), commandText(*command));
    }
    page += ".SH ENVIRONMENT\n" +
            manEntry(bold("NO_COLOR"), "If it is not empty, nothing is coloured.") +
            manEntry(bold("XDG_STATE_HOME"), "The folder in which velkor/history is.");
    page += ".SH FILES\n" + manEntry(italic("~/.local/state/velkor/history"),
                                     "What was typed at the prompt, where the variable "
                                     "XDG_STATE_HOME is not set.");
    return page;
}

// ---- bash ----

constexpr const char* bashHead =
    "# Completion of velkor-config for bash. Made by velkor-config --manual bash.\n"
    "_velkor_config_words() { mapfile -t COMPREPLY < <(compgen -W \"$1\" -- \"$current\"); }\n"
    "_velkor_config_files() {\n"
    "    compopt -o filenames\n"
    "    mapfile -t COMPREPLY < <(compgen -f -- \"$current\")\n"
    "}\n"
    "_velkor_config_types() { _velkor_config_words \"$types\"; }\n";

constexpr const char* bashTail =
    "_velkor_config() {\n"
    "    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]} i\n"
    "    COMPREPLY=()\n"
    "    for ((i = 1; i < COMP_CWORD; ++i)); do\n"
    "        [[ ${COMP_WORDS[i]} == -- ]] || continue\n"
    "        if ((i + 1 == COMP_CWORD)); then\n"
    "            _velkor_config_words \"$commands\"\n"
    "        else\n"
    "            _velkor_config_command \"${COMP_WORDS[i + 1]}\"\n"
    "        fi\n"
    "        return\n"
    "    done\n"
    "    _velkor_config_value && return\n"
    "    if [[ $current == -* ]]; then\n"
    "        _velkor_config_words \"$options\"\n"
    "    else\n"
    "        _velkor_config_files\n"
    "    fi\n"
    "}\n"
    "complete -F _velkor_config velkor-config\n";

/// What completes an argument called `name`.
std::string bashCompleter(std::string_view name) {
    if (name.find("FILE") == 0 || name.find("PATH") != std::string_view::npos) {
        return "_velkor_config_files";
    }
    if (name == "T") return "_velkor_config_types";
    if (name == "COMMAND") return "_velkor_config_words \"$commands\"";
    return ":";
}

std::string bashWords(const char* variable, const std::vector<std::string>& words) {
    return "    local " + std::string(variable) + "=\"" + joined(words, " ") + "\"\n";
}

std::vector<std::string> commandNames(const Commands& commands) {
    std::vector<std::string> names;
    for (const auto& command : commands) {
        names.push_back(command->name());
        if (command->shortName() != command->name()) names.emplace_back(command->shortName());
    }
    return names;
}

// Completes the value of an option of the program; fails where there is none to complete.
std::string bashValues(const ProgramUsage& usage) {
    std::string text = "_velkor_config_value() {\n    case $previous in\n";
    for (const auto& option : usage.options) {
        if (option.valueName.empty() || option.names.front().front() != '-') continue;
        text +=
            "    " + joined(option.names, "|") + ") " + bashCompleter(option.valueName) + " ;;\n";
    }
    return text + "    *) return 1 ;;\n    esac\n}\n";
}

std::string bashCommand(const Command& command) {
    const CommandUsage usage = command.usage();
    std::vector<std::string> options;
    std::string values;
    for (const auto& option : usage.options) {
        options.push_back(option.name);
        if (option.valueName.empty()) continue;
        values +=
            "        " + option.name + ") " + bashCompleter(option.valueName) + "; return ;;\n";
    }
    std::string names = '\'' + command.name() + '\'';
    if (command.shortName() != command.name())
        names += "|'" + std::string(command.shortName()) + '\'';
    std::string text = "    " + names + ")\n";
    if (!values.empty()) text += "        case $previous in\n" + values + "        esac\n";
    text += "        [[ $current == -* ]] && { _velkor_config_words \"" + joined(options, " ") +
            "\"; return; }\n";
    return text + "        " + bashCompleter(usage.argumentName(0)) + "\n        ;;\n";
}

std::string bashCompletion(const ProgramUsage& usage, const Commands& commands) {
    std::vector<std::string> options;
    for (const auto& option : usage.options) {
        if (option.names.front().front() != '-') continue;
        options.insert(options.end(), option.names.begin(), option.names.end());
    }
    options.emplace_back("--");
    std::string text =
        bashHead + bashValues(usage) + "_velkor_config_command() {\n    case $1 in\n";
    for (const auto& command : commands) text += bashCommand(*command);
    text += "    esac\n}\n";
    std::string tail = bashTail;
    const std::string words = bashWords("options", options) +
                              bashWords("commands", commandNames(commands)) +
                              bashWords("types", typeNames());
    tail.insert(tail.find("    COMPREPLY=()"), words);
    return text + tail;
}

struct Form {
    std::string_view name;
    std::string (*make)(const ProgramUsage&, const Commands&);
};

constexpr Form forms[] = {{"man", manPage}, {"bash", bashCompletion}, {"usage", usageLines}};

}  // namespace

std::string manual(const std::string& form, const ProgramUsage& usage, const Commands& commands) {
    const auto* const found = std::find_if(std::begin(forms), std::end(forms),
                                           [&](const Form& each) { return each.name == form; });
    if (found == std::end(forms)) {
        throw UsageError("--manual: one of man, bash, usage is needed");
    }
    return found->make(usage, commands);
}

}  // namespace velkor::host
