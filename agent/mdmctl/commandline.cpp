// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commandline.h"

#include "exitstatus.h"
#include "output.h"
#include "suggestion.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <iostream>
#include <list>
#include <optional>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String jsonName("--json");

/** Where the walk along the words ended. */
struct Found {
    QVector<const Command *> path; ///< from the program down
    QStringList words; ///< with "--json" behind the command, where it is looked for
    QString error;
};

QStringList namesOf(const QVector<Command> &commands)
{
    QStringList names;
    for (const Command &command : commands)
        names.append(command.name);
    return names;
}

QString pathText(const QVector<const Command *> &path)
{
    QStringList names;
    for (const Command *command : path)
        names.append(command->name);
    return names.join(QLatin1Char(' '));
}

bool isOption(const QString &word)
{
    return word.startsWith(QLatin1Char('-'));
}

bool knowsOption(const Command &command, const QString &name)
{
    const auto isNamed = [&name](const Option &option) {
        return option.name == name;
    };
    return std::any_of(command.options.cbegin(), command.options.cend(), isNamed)
        || std::any_of(command.commands.cbegin(), command.commands.cend(),
                       [&name](const Command &further) { return knowsOption(further, name); });
}

// CLI11 tells of a wrong command only that it did not expect it, so commands are looked up here.
Found find(const Command &program, const QStringList &words)
{
    Found found{{&program}, {}, {}};
    QStringList early;
    auto word = words.cbegin();
    for (; word != words.cend() && !found.path.last()->commands.isEmpty(); ++word) {
        if (isOption(*word)) {
            // What follows may be its value, so that the walk cannot go on.
            const QString name = word->section(QLatin1Char('='), 0, 0);
            if (name != jsonName && knowsOption(program, name)) {
                found.error = QStringLiteral("option \"%1\" goes behind the command it is for").arg(name);
                return found;
            }
            early.append(*word);
            continue;
        }
        const QVector<Command> &commands = found.path.last()->commands;
        const auto command = std::find_if(commands.cbegin(), commands.cend(),
                                          [&](const Command &each) { return each.name == *word; });
        if (command == commands.cend()) {
            found.error = QStringLiteral("unknown command \"%1\": %2")
                              .arg(*word, suggestion(*word, namesOf(commands)));
            return found;
        }
        found.path.append(&*command);
        found.words.append(*word);
    }
    const bool json = early.removeAll(jsonName) > 0;
    const QVector<Command> &further = found.path.last()->commands;
    if (!further.isEmpty() && early.isEmpty()) {
        found.error = QStringLiteral("\"%1\" needs a command: %2")
                          .arg(pathText(found.path), suggestion(QString(), namesOf(further)));
    }
    found.words = early + found.words;
    if (json)
        found.words.append(jsonName);
    found.words.append(words.mid(int(word - words.cbegin())));
    return found;
}

class HelpFormatter : public CLI::Formatter
{
public:
    HelpFormatter()
    {
        column_width(26);
        label("Positionals", "Arguments");
        label("SUBCOMMAND", "COMMAND");
    }

    std::string make_option_opts(const CLI::Option *option) const override
    {
        const bool named = option->get_positional() || option->get_type_size() == 0;
        return named ? std::string() : ' ' + option->get_type_name();
    }

    std::string make_usage(const CLI::App *app, std::string name) const override
    {
        std::string usage = CLI::Formatter::make_usage(app, name);
        const std::string plain = "SUBCOMMAND";
        const std::size_t at = usage.find(plain);
        return at == std::string::npos ? usage : usage.replace(at, plain.size(), get_label(plain));
    }
};

/** CLI11's picture of the commands, and what it has found on the command line. */
class Parser
{
public:
    explicit Parser(const Command &program)
        : m_app(program.summary.toStdString(), program.name.toStdString())
    {
        m_app.formatter(std::make_shared<HelpFormatter>());
        m_app.set_version_flag("--version", program.name.toStdString() + " " MDMCTL_VERSION,
                               "Show the version and exit");
        describe(&m_app, program, program.name);
    }

    /** @return an exit status when there is nothing left to be run. */
    std::optional<int> parse(const QStringList &words);

    Values valuesFor(const Command &command) const;

private:
    struct Input {
        const Command *command;
        QString name;
        CLI::Option *option;
        std::vector<std::string> values;
    };

    void describe(CLI::App *app, const Command &command, const QString &path);
    Input &addInput(const Command &command, const QString &name);
    void addArgument(CLI::App *app, const Command &command, const Argument &argument);
    void addOption(CLI::App *app, const Command &command, const Option &option);
    QString explain(const CLI::ParseError &error) const;
    QString explainExtra() const;
    QString usage() const;
    const CLI::App *parsedApp() const;

    CLI::App m_app;
    std::list<Input> m_inputs; // CLI11 holds on to addresses
};

void Parser::describe(CLI::App *app, const Command &command, const QString &path)
{
    app->group("Commands");
    app->set_help_flag("-h,--help", "Show this help and exit");
    QString footer = command.description;
    if (command.run) {
        footer += QStringLiteral(
            "\n\nExit status: 0 done, 1 refused or failed, 2 wrong usage (nothing was sent), "
            "3 service\nnot available.");
    } else {
        footer += QStringLiteral("\n\n\"%1 COMMAND --help\" tells more about a command.").arg(path);
    }
    app->footer(footer.trimmed().toStdString());
    for (const Argument &argument : command.arguments)
        addArgument(app, command, argument);
    for (const Option &option : command.options)
        addOption(app, command, option);
    for (const Command &further : command.commands) {
        describe(app->add_subcommand(further.name.toStdString(), further.summary.toStdString()), further,
                 path + QLatin1Char(' ') + further.name);
    }
}

Parser::Input &Parser::addInput(const Command &command, const QString &name)
{
    m_inputs.push_back({&command, name, nullptr, {}});
    return m_inputs.back();
}

void Parser::addArgument(CLI::App *app, const Command &command, const Argument &argument)
{
    Input &input = addInput(command, argument.name);
    input.option = app->add_option(argument.name.toStdString(), input.values, argument.help.toStdString());
    input.option->required(argument.count != Argument::Optional);
    input.option->expected(1, argument.count == Argument::Several ? -1 : 1);
    input.option->allow_extra_args(argument.count == Argument::Several);
}

void Parser::addOption(CLI::App *app, const Command &command, const Option &option)
{
    const std::string name = option.name.toStdString();
    const std::string help = option.help.toStdString();
    Input &input = addInput(command, option.name);
    if (option.valueName.isEmpty()) {
        input.option = app->add_flag(name, help);
    } else {
        input.option = app->add_option(name, input.values, help)->expected(1);
        input.option->type_name(option.valueName.toStdString());
    }
}

std::optional<int> Parser::parse(const QStringList &words)
{
    std::vector<std::string> reversed;
    for (auto word = words.crbegin(); word != words.crend(); ++word)
        reversed.push_back(word->toStdString());
    try {
        m_app.parse(std::move(reversed));
    } catch (const CLI::Success &request) {
        return m_app.exit(request, std::cout, std::cerr);
    } catch (const CLI::ParseError &error) {
        printError(explain(error));
        return ExitUsage;
    }
    return std::nullopt;
}

const CLI::App *Parser::parsedApp() const
{
    const CLI::App *app = &m_app;
    while (!app->get_subcommands().empty())
        app = app->get_subcommands().back();
    return app;
}

QString Parser::explainExtra() const
{
    const std::vector<std::string> extras = m_app.remaining(true);
    const QString extra = extras.empty() ? QString() : QString::fromStdString(extras.front());
    if (!isOption(extra))
        return QStringLiteral("unexpected argument \"%1\"; usage: %2").arg(extra, usage());
    QStringList names;
    for (const CLI::Option *option : parsedApp()->get_options()) {
        if (option->nonpositional())
            names.append(QLatin1String("--") + QString::fromStdString(option->get_lnames().front()));
    }
    return QStringLiteral("unknown option \"%1\": %2").arg(extra, suggestion(extra, names));
}

QString Parser::explain(const CLI::ParseError &error) const
{
    if (dynamic_cast<const CLI::ExtrasError *>(&error))
        return explainExtra();
    QString reason = QString::fromUtf8(error.what());
    if (dynamic_cast<const CLI::RequiredError *>(&error))
        reason.replace(QLatin1String(" is required"), QLatin1String(" is missing"));
    else if (dynamic_cast<const CLI::ArgumentMismatch *>(&error))
        reason = reason.section(QLatin1Char(':'), 0, 0) + QLatin1String(" needs a value");

    return QStringLiteral("%1; usage: %2").arg(reason, usage());
}

QString Parser::usage() const
{
    const CLI::App *app = parsedApp();
    QStringList words;
    for (const CLI::App *each = app; each; each = each->get_parent())
        words.prepend(QString::fromStdString(each->get_name()));
    for (const CLI::Option *option : app->get_options()) {
        if (!option->get_positional())
            continue;
        QString name = QString::fromStdString(option->get_name(true));
        if (option->get_expected_max() > 1)
            name += QLatin1String("...");
        words.append(option->get_required() ? name : QStringLiteral("[%1]").arg(name));
    }
    return words.join(QLatin1Char(' '));
}

Values Parser::valuesFor(const Command &command) const
{
    Values values;
    for (const Input &input : m_inputs) {
        if (input.command != &command || input.option->empty())
            continue;
        QStringList given;
        for (const std::string &value : input.values)
            given.append(QString::fromStdString(value));
        values.set(input.name, given);
    }
    return values;
}

QString faultOf(const QString &name, const QStringList &values, const QStringList &choices,
                const ValueCheck &check)
{
    for (const QString &value : values) {
        QString fault;
        if (!choices.isEmpty() && !choices.contains(value))
            fault = suggestion(value, choices);
        else if (check)
            fault = check(value);
        if (!fault.isEmpty())
            return QStringLiteral("%1 \"%2\": %3").arg(name, value, fault);
    }
    return QString();
}

QString faultOf(const Command &command, const Values &values)
{
    for (const Argument &argument : command.arguments) {
        const QString fault
            = faultOf(argument.name, values.all(argument.name), argument.choices, argument.check);
        if (!fault.isEmpty())
            return fault;
    }
    for (const Option &option : command.options) {
        const QString fault = faultOf(option.name, values.all(option.name), {}, option.check);
        if (!fault.isEmpty())
            return fault;
    }
    return QString();
}

} // namespace

int runCommandLine(const Command &program, const QStringList &words)
{
    const Found found = find(program, words);
    if (!found.error.isEmpty()) {
        printError(found.error);
        return ExitUsage;
    }
    Parser parser(program);
    if (const std::optional<int> status = parser.parse(found.words))
        return *status;
    const Command &command = *found.path.last();
    const Values values = parser.valuesFor(command);
    const QString fault = faultOf(command, values);
    if (!fault.isEmpty()) {
        printError(fault);
        return ExitUsage;
    }
    return command.run(values);
}

} // namespace Agent
} // namespace Corvane
