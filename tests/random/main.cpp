// SPDX-License-Identifier: LGPL-2.1-or-later
// Says anything at all to the library: random, well-formed messages from strangers in the place of the
// services.
#include "stranger.h"
#include "subject.h"
#include "testedclass.h"

#include <QtCore/QCommandLineParser>
#include <QtCore/QCoreApplication>

#include <cstdio>

namespace
{

constexpr int wrongUsage = 2;

/** The number given for @p option; ends the program if it is none. */
quint64 numberOf(const QCommandLineParser &parser, const QString &option)
{
    bool isNumber = false;
    const quint64 number = parser.value(option).toULongLong(&isNumber);
    if (isNumber)
        return number;
    std::fprintf(stderr, "--%s takes a number\n", qUtf8Printable(option));
    std::exit(wrongUsage);
}

QStringList classNames()
{
    QStringList names;
    for (const TestedClass &tested : testedClasses())
        names.append(QLatin1String(tested.name));
    return names;
}

} // namespace

int main(int argc, char *argv[])
{
    QCoreApplication application(argc, argv);
    QCommandLineParser parser;
    parser.setApplicationDescription(QStringLiteral(
        "Sends random messages to the classes of the library, from strangers in the place of the phone's "
        "services.\nRuns inside corvane-simulator. Ends with status 1 when a crash, a hang or a leak was "
        "found, and says how to see it again."));
    parser.addHelpOption();
    const QString seed = QStringLiteral("seed");
    const QString messages = QStringLiteral("messages");
    const QString from = QStringLiteral("from");
    const QString lives = QStringLiteral("lives");
    const QString patience = QStringLiteral("patience");
    const QString oneClass = QStringLiteral("class");
    const QString list = QStringLiteral("classes");
    const QString verbose = QStringLiteral("verbose");
    const QString subject = QStringLiteral("subject");
    parser.addOptions({
        {seed, QStringLiteral("what all is drawn from"), QStringLiteral("number"), QStringLiteral("1")},
        {messages, QStringLiteral("how many to send at least"), QStringLiteral("number"),
         QStringLiteral("3000")},
        {from, QStringLiteral("the life to begin with"), QStringLiteral("number"), QStringLiteral("0")},
        {lives, QStringLiteral("how many lives, whatever the messages"), QStringLiteral("number"),
         QStringLiteral("0")},
        {patience, QStringLiteral("seconds of silence that are a hang"), QStringLiteral("number"),
         QStringLiteral("60")},
        {oneClass, QStringLiteral("only lives that begin with this class; may be repeated"),
         QStringLiteral("name")},
        {list, QStringLiteral("list the classes")},
        {verbose, QStringLiteral("tell every message, call and warning")},
    });
    QCommandLineOption subjectOption(subject);
    subjectOption.setFlags(QCommandLineOption::HiddenFromHelp);
    parser.addOption(subjectOption);
    parser.process(application);

    if (parser.isSet(subject))
        return runSubject(parser.isSet(verbose));
    if (parser.isSet(list)) {
        std::puts(qUtf8Printable(classNames().join(QLatin1Char('\n'))));
        return 0;
    }

    RunSettings settings;
    settings.seed = numberOf(parser, seed);
    settings.messages = numberOf(parser, messages);
    settings.from = numberOf(parser, from);
    settings.lives = numberOf(parser, lives);
    settings.patience = int(numberOf(parser, patience));
    settings.verbose = parser.isSet(verbose);
    settings.hasAllClasses = !parser.isSet(oneClass);
    settings.classes = parser.isSet(oneClass) ? parser.values(oneClass) : classNames();
    for (const QString &name : qAsConst(settings.classes)) {
        if (!classNames().contains(name)) {
            std::fprintf(stderr, "there is no class %s; --classes lists them\n", qUtf8Printable(name));
            return wrongUsage;
        }
    }

    QByteArrayList arguments{"--subject"};
    if (settings.verbose)
        arguments.append("--verbose");
    Stranger stranger(settings);
    return stranger.run(QCoreApplication::applicationFilePath().toLocal8Bit(), arguments);
}
