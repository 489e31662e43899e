// SPDX-License-Identifier: Apache-2.0
// Scripts for shells, made of the commands that the parser knows.
#include "CliOptions.h"
#include "Console.h"
#include "commands.h"

#include <functional>
#include <string>
#include <vector>

namespace {

struct OptionEntry
{
    QStringList names; ///< with their dashes
    QString help;
    QStringList values; ///< those that it takes, if they have names
    bool takesValue = false;
};

struct CommandEntry
{
    QString path; ///< " instr list"; empty for the program itself
    QString help;
    QList<OptionEntry> options;
    QStringList children; ///< names and helps, in turns
};

QString textOf(const std::string &text)
{
    return QString::fromStdString(text).section('\n', 0, 0);
}

OptionEntry entryOf(const CLI::Option &option)
{
    OptionEntry entry;
    for (const std::string &name : option.get_snames()) {
        entry.names.append('-' + QString::fromStdString(name));
    }
    for (const std::string &name : option.get_lnames()) {
        entry.names.append("--" + QString::fromStdString(name));
    }
    entry.help = textOf(option.get_description());
    entry.takesValue = option.get_items_expected_max() > 0;
    const QString type = QString::fromStdString(option.get_type_name());
    if (type.contains('|')) {
        entry.values = type.split('|');
    }
    return entry;
}

/// The command and all below it.
void collect(const CLI::App &app, const QString &path, QList<CommandEntry> &commands)
{
    CommandEntry entry{
        .path = path, .help = textOf(app.get_description()), .options = {}, .children = {}};
    for (const CLI::Option *option : app.get_options()) {
        if (option->nonpositional() && !option->get_group().empty()) {
            entry.options.append(entryOf(*option));
        }
    }
    const auto children = app.get_subcommands([](const CLI::App *) { return true; });
    for (const CLI::App *child : children) {
        entry.children.append(
            {QString::fromStdString(child->get_name()), textOf(child->get_description())});
    }
    commands.append(entry);
    for (const CLI::App *child : children) {
        collect(*child, path + ' ' + QString::fromStdString(child->get_name()), commands);
    }
}

/// A text in single quotes; the shells differ in how they take one inside.
QString quoted(QString text, const char *quote = "'\\''")
{
    return '\'' + text.replace('\'', quote) + '\'';
}

/// The patterns of a case statement for the commands' paths.
QString pathPatterns(const QList<CommandEntry> &commands)
{
    QStringList patterns;
    for (const CommandEntry &command : commands) {
        if (!command.path.isEmpty()) {
            patterns.append(quoted(command.path));
        }
    }
    return patterns.join('|');
}

QString bashScript(const QList<CommandEntry> &commands)
{
    QString script = QString(R"(# bash completion for corvane-cli
_corvane_cli()
{
    local cur=${COMP_WORDS[COMP_CWORD]} prev=${COMP_WORDS[COMP_CWORD-1]} at= i commands= options= values=
    for ((i = 1; i < COMP_CWORD; i++)); do
        case "$at ${COMP_WORDS[i]}" in
        %1) at+=" ${COMP_WORDS[i]}" ;;
        esac
    done
    case $at in
)")
                         .arg(pathPatterns(commands));
    for (const CommandEntry &command : commands) {
        QStringList names;
        QString valueCases;
        for (const OptionEntry &option : command.options) {
            names += option.names;
            if (option.takesValue) {
                valueCases +=
                    QString("        %1) values=%2 ;;\n")
                        .arg(option.names.join('|'),
                             option.values.isEmpty() ? "-" : quoted(option.values.join(' ')));
            }
        }
        QStringList children;
        for (qsizetype i = 0; i < command.children.size(); i += 2) {
            children.append(command.children.at(i));
        }
        script +=
            QString("    %1)\n        commands=%2\n        options=%3\n")
                .arg(quoted(command.path), quoted(children.join(' ')), quoted(names.join(' ')));
        if (!valueCases.isEmpty()) {
            script += "        case $prev in\n" + valueCases + "        esac\n";
        }
        script += "        ;;\n";
    }
    return script + R"(    esac
    COMPREPLY=()
    if [[ $values == - ]]; then
        return
    elif [[ $values ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$values" -- "$cur")
    elif [[ $cur == -* ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$options" -- "$cur")
    elif [[ $commands ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$commands" -- "$cur")
    fi
}
complete -o default -F _corvane_cli corvane-cli
)";
}

QString zshScript(const QList<CommandEntry> &commands)
{
    const auto described = [](const QString &name, const QString &help) {
        return ' ' + quoted(QString(name).replace(':', "\\:") + ':' + help);
    };
    QString script = QString(R"(#compdef corvane-cli
local at= word values=
local -a commands options
for word in ${words[2,CURRENT-1]}; do
    case "$at $word" in
    %1) at+=" $word" ;;
    esac
done
case $at in
)")
                         .arg(pathPatterns(commands));
    for (const CommandEntry &command : commands) {
        QString options;
        QString valueCases;
        for (const OptionEntry &option : command.options) {
            for (const QString &name : option.names) {
                options += described(name, option.help);
            }
            if (option.takesValue) {
                valueCases +=
                    QString("    %1) values=%2 ;;\n")
                        .arg(option.names.join('|'),
                             option.values.isEmpty() ? "-" : quoted(option.values.join(' ')));
            }
        }
        QString children;
        for (qsizetype i = 0; i < command.children.size(); i += 2) {
            children += described(command.children.at(i), command.children.at(i + 1));
        }
        script += QString("%1)\n    commands=(%2)\n    options=(%3)\n")
                      .arg(quoted(command.path), children, options);
        if (!valueCases.isEmpty()) {
            script += "    case ${words[CURRENT-1]} in\n" + valueCases + "    esac\n";
        }
        script += "    ;;\n";
    }
    return script + R"(esac
if [[ $values == - ]]; then
    _files
elif [[ -n $values ]]; then
    compadd -- ${=values}
elif [[ $PREFIX == -* ]]; then
    _describe option options
elif (( $#commands )); then
    _describe command commands
else
    _files
fi
)";
}

QString fishScript(const QList<CommandEntry> &commands)
{
    const auto fishQuoted = [](QString text) { return quoted(text.replace('\\', "\\\\"), "\\'"); };
    QStringList paths;
    for (const CommandEntry &command : commands) {
        paths.append(fishQuoted(command.path));
    }
    QString script = QString(R"(# fish completion for corvane-cli
function __corvane_cli_at
    set -l paths %1
    set -l at ''
    for word in (commandline -opc)[2..-1]
        if contains -- "$at $word" $paths
            set at "$at $word"
        end
    end
    test "$at" = "$argv[1]"
end
)")
                         .arg(paths.join(' '));
    for (const CommandEntry &command : commands) {
        // The condition is a command of its own, in quotes once more.
        const QString begin = "complete -c corvane-cli -n " +
                              fishQuoted("__corvane_cli_at " + quoted(command.path, "\\'"));
        for (qsizetype i = 0; i < command.children.size(); i += 2) {
            script +=
                QString("%1 -f -a %2 -d %3\n")
                    .arg(begin, command.children.at(i), fishQuoted(command.children.at(i + 1)));
        }
        for (const OptionEntry &option : command.options) {
            script += begin;
            for (const QString &name : option.names) {
                script += name.startsWith("--") ? " -l " + name.mid(2) : " -s " + name.mid(1);
            }
            if (!option.values.isEmpty()) {
                script += " -x -a " + fishQuoted(option.values.join(' '));
            } else if (option.takesValue) {
                script += " -r";
            }
            script += " -d " + fishQuoted(option.help) + '\n';
        }
    }
    return script;
}

} // namespace

void addCompletionCommand(CommandSet &commands)
{
    const auto shell = std::make_shared<int>(0);
    CLI::App &app = commands.app;
    CLI::App *command =
        app.add_subcommand("completion", "Print the script that completes commands in a shell");
    addChoice(*command, "shell", *shell, {"bash", "zsh", "fish"}, "The shell")->required();
    command->footer("Example: corvane-cli completion bash > "
                    "~/.local/share/bash-completion/completions/corvane-cli");
    command->callback([&commands, &app, shell] {
        // Made now, while the parser lives.
        QList<CommandEntry> table;
        collect(app, {}, table);
        const QString script = *shell == 0   ? bashScript(table)
                               : *shell == 1 ? zshScript(table)
                                             : fishScript(table);
        commands.action = [&console = commands.console, script] {
            return console.print(script.toUtf8()) ? int{ExitDone} : console.failed();
        };
    });
}
