// SPDX-License-Identifier: LGPL-2.1-or-later
// Another process with the location settings: does what standard input tells, and answers each line with one.
#include <corvanemdm/locationsettings.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QSocketNotifier>
#include <QtCore/QTextStream>

#include <unistd.h>

using Corvane::Mdm::LocationSettings;

namespace
{

QString answer(LocationSettings *settings, const QString &line)
{
    const QString word = line.section(QLatin1Char(' '), 0, 0);
    const QString argument = line.section(QLatin1Char(' '), 1);
    const auto text = [](bool flag) {
        return flag ? QStringLiteral("true") : QStringLiteral("false");
    };
    if (word == QLatin1String("available"))
        return text(settings->agpsAvailable(argument));
    if (word == QLatin1String("providers"))
        return settings->availableAgpsProviders().join(QLatin1Char(' '));
    if (word == QLatin1String("enabled"))
        return text(settings->locationEnabled());
    if (word == QLatin1String("enable")) {
        settings->setLocationEnabled(argument == QLatin1String("true"));
        return QStringLiteral("done");
    }
    return QStringLiteral("?");
}

} // namespace

int main(int argc, char **argv)
{
    QCoreApplication application(argc, argv);
    LocationSettings settings;
    QTextStream output(stdout);
    QObject::connect(&settings, &LocationSettings::locationEnabledChanged, &application, [&] {
        output << "changed " << answer(&settings, QStringLiteral("enabled")) << '\n';
        output.flush();
    });
    QSocketNotifier notifier(STDIN_FILENO, QSocketNotifier::Read);
    QTextStream input(stdin);
    QObject::connect(&notifier, &QSocketNotifier::activated, &application, [&] {
        QString line;
        if (!input.readLineInto(&line)) {
            QCoreApplication::quit();
            return;
        }
        output << answer(&settings, line) << '\n';
        output.flush();
    });
    return QCoreApplication::exec();
}
