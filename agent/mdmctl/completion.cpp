// SPDX-License-Identifier: LGPL-2.1-or-later
#include "completion.h"

#include "exitstatus.h"
#include "output.h"

#include <functional>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String bashScript(R"(# Completion of mdmctl for bash, written by "mdmctl completion bash".
_mdmctl()
{
    local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
    local command=mdmctl position=0 words= i
    for ((i = 1; i < COMP_CWORD; i++)); do
        case "$command ${COMP_WORDS[i]}" in
%1) command+=" ${COMP_WORDS[i]}" ;;
        *" -"*) ;;
        *) ((position++)) ;;
        esac
        case ${COMP_WORDS[i]} in
        %2) ((i++)) ;;
        esac
    done
    case $previous in
    %2) return ;;
    esac
    if [[ $current == -* ]]; then
        case $command in
%3        esac
    else
        case $command:$position in
%4        esac
    fi
    if [[ $words == FILE ]]; then
        compopt -o filenames
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
    else
        mapfile -t COMPREPLY < <(compgen -W "$words" -- "$current")
    fi
}
complete -F _mdmctl mdmctl)");

QString quoted(const QString &text)
{
    return QLatin1Char('"') + text + QLatin1Char('"');
}

QString branch(const QString &pattern, const QString &words)
{
    return QStringLiteral("        \"%1\") words=\"%2\" ;;\n").arg(pattern, words);
}

void visit(const Command &command, const QString &path,
           const std::function<void(const Command &, const QString &)> &visitor)
{
    visitor(command, path);
    for (const Command &further : command.commands)
        visit(further, path + QLatin1Char(' ') + further.name, visitor);
}

QString wordsOf(const Argument &argument)
{
    return argument.kind == Argument::File ? QStringLiteral("FILE") : argument.choices.join(QLatin1Char(' '));
}

QString bashCompletion(const Command &program)
{
    QStringList commands;
    QStringList valued;
    QString options;
    QString words;
    visit(program, program.name, [&](const Command &command, const QString &path) {
        if (&command != &program)
            commands.append(QLatin1String("        ") + quoted(path));
        QStringList names;
        for (const Option &option : command.options) {
            names.append(option.name);
            if (!option.valueName.isEmpty() && !valued.contains(option.name))
                valued.append(option.name);
        }
        names.append(QStringLiteral("--help"));
        if (&command == &program)
            names.append(QStringLiteral("--version"));
        options += branch(path, names.join(QLatin1Char(' ')));
        QStringList further;
        for (const Command &each : command.commands)
            further.append(each.name);
        if (!further.isEmpty())
            words += branch(path + QLatin1String(":0"), further.join(QLatin1Char(' ')));
        for (int i = 0; i < command.arguments.size(); ++i) {
            const QString candidates = wordsOf(command.arguments.at(i));
            if (!candidates.isEmpty())
                words += branch(QStringLiteral("%1:%2").arg(path).arg(i), candidates);
        }
    });
    return bashScript.arg(commands.join(QLatin1String(" | \\\n")), valued.join(QLatin1String(" | ")), options,
                          words);
}

} // namespace

Command completionCommand(const Command &program)
{
    Command bash;
    bash.name = QStringLiteral("bash");
    bash.summary = QStringLiteral("Print the completion script for bash");
    bash.description = QStringLiteral("Example:\n  source <(mdmctl completion bash)");

    Command completion;
    completion.name = QStringLiteral("completion");
    completion.summary = QStringLiteral("Make the shell complete mdmctl's commands");
    completion.commands = {bash};

    Command whole = program;
    whole.commands.append(completion);
    completion.commands.first().run = [whole](const Values &) {
        print(bashCompletion(whole));
        return ExitDone;
    };
    return completion;
}

} // namespace Agent
} // namespace Corvane
