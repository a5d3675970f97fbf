// SPDX-License-Identifier: LGPL-2.1-or-later
#include "commands.h"
#include "exitstatus.h"
#include "output.h"
#include "service.h"
#include "table.h"
#include "truststore.h"
#include "wait.h"

#include <inputfile.h>

#include <QtCore/QDateTime>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

using Mdm::CertificateFile;
using Mdm::Certificates;
using Run = std::function<int(TrustStore &, const Values &)>;

namespace
{

const QLatin1String nameArgument("NAME");
const QLatin1String fileArgument("FILE");
const QLatin1String nameName("--name");
const QLatin1String systemName("--system");
const QLatin1String blacklistedName("--blacklisted");

QString dayOf(const QDateTime &time)
{
    return time.toUTC().date().toString(Qt::ISODate);
}

QJsonObject certificateJson(const QSslCertificate &certificate)
{
    return {
        {QStringLiteral("subject"), subjectOf(certificate)},
        {QStringLiteral("issuer"), issuerOf(certificate)},
        {QStringLiteral("effective"), certificate.effectiveDate().toUTC().toString(Qt::ISODate)},
        {QStringLiteral("expires"), certificate.expiryDate().toUTC().toString(Qt::ISODate)},
        {QStringLiteral("fingerprint"), fingerprintOf(certificate)},
    };
}

QJsonArray certificatesJson(const QList<QSslCertificate> &certificates)
{
    QJsonArray array;
    for (const QSslCertificate &certificate : certificates)
        array.append(certificateJson(certificate));
    return array;
}

QJsonObject fileJson(const CertificateFile &file)
{
    return {{QStringLiteral("file"), file.fileName()},
            {QStringLiteral("certificates"), certificatesJson(file.certificates())}};
}

QJsonArray filesJson(const QList<CertificateFile> &files)
{
    QJsonArray array;
    for (const CertificateFile &file : files)
        array.append(fileJson(file));
    return array;
}

void addRows(Table &table, const QString &list, const QString &file,
             const QList<QSslCertificate> &certificates)
{
    constexpr int enoughToTellApart = 16;
    if (certificates.isEmpty())
        table.addRow({list, file, QStringLiteral("(no certificate)"), {}, {}, {}});
    for (const QSslCertificate &certificate : certificates) {
        table.addRow({list, file, subjectOf(certificate), issuerOf(certificate),
                      dayOf(certificate.expiryDate()), fingerprintOf(certificate).left(enoughToTellApart)});
    }
}

int runList(TrustStore &store, const Values &values)
{
    const bool withSystem = values.has(systemName);
    const QList<QSslCertificate> system
        = withSystem ? store.certificates().certificates() : QList<QSslCertificate>();
    if (wantsJson(values)) {
        QJsonObject json{{QStringLiteral("installed"), filesJson(store.files(true))},
                         {QStringLiteral("blacklisted"), filesJson(store.files(false))}};
        if (withSystem)
            json.insert(QStringLiteral("system"), certificatesJson(system));
        print(json);
        return ExitDone;
    }
    Table table({QStringLiteral("LIST"), QStringLiteral("FILE"), QStringLiteral("SUBJECT"),
                 QStringLiteral("ISSUER"), QStringLiteral("EXPIRES"), QStringLiteral("FINGERPRINT")});
    bool isEmpty = system.isEmpty();
    if (!isEmpty)
        addRows(table, QStringLiteral("system"), QString(), system);
    for (const bool trusted : {true, false}) {
        const QList<CertificateFile> files = store.files(trusted);
        for (const CertificateFile &file : files) {
            addRows(table, trusted ? QStringLiteral("installed") : QStringLiteral("blacklisted"),
                    file.fileName(), file.certificates());
            isEmpty = false;
        }
    }
    print(isEmpty ? QStringLiteral("There are no files.") : table.toString());
    return ExitDone;
}

void printCertificate(const QSslCertificate &certificate)
{
    const auto line = [](const char *key, const QString &value) {
        print(QStringLiteral("  %1%2").arg(QLatin1String(key), -13).arg(value));
    };
    line("Subject", subjectOf(certificate));
    line("Issuer", issuerOf(certificate));
    line("Serial", QString::fromLatin1(certificate.serialNumber()));
    line("Effective", certificate.effectiveDate().toUTC().toString(Qt::ISODate));
    line("Expires", certificate.expiryDate().toUTC().toString(Qt::ISODate));
    line("Fingerprint", fingerprintOf(certificate));
}

int runShow(TrustStore &store, const Values &values)
{
    const bool trusted = !values.has(blacklistedName);
    const QList<CertificateFile> files = store.files(trusted);
    const QString name = values.first(nameArgument);
    const auto file = std::find_if(files.cbegin(), files.cend(),
                                   [&name](const CertificateFile &each) { return each.fileName() == name; });
    if (file == files.cend()) {
        printError(QStringLiteral("there is no %1 file \"%2\"")
                       .arg(trusted ? QStringLiteral("installed") : QStringLiteral("blacklisted"), name));
        return ExitFailed;
    }
    if (wantsJson(values)) {
        print(fileJson(*file));
        return ExitDone;
    }
    print(file->fileName());
    const QList<QSslCertificate> certificates = file->certificates();
    for (const QSslCertificate &certificate : certificates) {
        if (certificate != certificates.first())
            print(QString());
        printCertificate(certificate);
    }
    if (certificates.isEmpty())
        print(QStringLiteral("  (no certificate)"));
    return ExitDone;
}

Run runPut(bool trusted)
{
    return [trusted](TrustStore &store, const Values &values) -> int {
        constexpr qint64 largest = 4 * 1024 * 1024;
        const QString source = values.first(fileArgument);
        if (source == QLatin1String("-") && !values.has(nameName)) {
            printError(QStringLiteral("standard input has no name for the phone: give it one with ")
                       + nameName);
            return ExitUsage;
        }
        const QString name = values.has(nameName) ? values.first(nameName) : certificateFileName(source);
        const QString fault = certificateFileNameFault(name);
        if (!fault.isEmpty()) {
            printError(QStringLiteral("%1 \"%2\": %3").arg(nameName, name, fault));
            return ExitUsage;
        }
        const InputFile file = readInputFile(source, largest);
        if (!file.error.isEmpty()) {
            printError(QStringLiteral("%1 %2").arg(file.name, file.error));
            return ExitUsage;
        }
        // Certificates come in two forms; the phone wants the one.
        QList<QSslCertificate> certificates = QSslCertificate::fromData(file.content, QSsl::Pem);
        if (certificates.isEmpty())
            certificates = QSslCertificate::fromData(file.content, QSsl::Der);
        if (certificates.isEmpty()) {
            printError(QStringLiteral("%1 has no certificate").arg(file.name));
            return ExitUsage;
        }
        QByteArray pem;
        for (const QSslCertificate &certificate : qAsConst(certificates))
            pem += certificate.toPem();
        return conclude(store.put(trusted, name, pem));
    };
}

Run runRemove(bool trusted)
{
    return [trusted](TrustStore &store, const Values &values) -> int {
        ExitStatus status = ExitDone;
        const QStringList names = values.all(nameArgument);
        for (const QString &name : names) {
            const ExitStatus each = conclude(store.remove(trusted, name));
            if (each != ExitDone)
                status = each;
        }
        return status;
    };
}

QString namesText(const QList<CertificateFile> &files)
{
    QStringList names;
    for (const CertificateFile &file : files)
        names.append(file.fileName());
    return names.isEmpty() ? QStringLiteral("no files") : names.join(QLatin1String(", "));
}

int runWatch(TrustStore &store, const Values &values)
{
    const EventLog log(wantsJson(values));
    Wait wait(Service::certificateHelper(), Wait::Forever, QString());
    const auto tell = [&](bool trusted, const QString &event, const QString &text) {
        const QList<CertificateFile> files = store.files(trusted);
        log.write(text.arg(namesText(files)),
                  {{QStringLiteral("event"), event}, {QStringLiteral("files"), filesJson(files)}});
    };
    // What is not listed is not watched.
    store.files(true);
    store.files(false);
    QObject::connect(&store.certificates(), &Certificates::installedFilesChanged, &wait, [&] {
        tell(true, QStringLiteral("installedChanged"), QStringLiteral("Installed: %1"));
    });
    QObject::connect(&store.certificates(), &Certificates::blacklistedFilesChanged, &wait, [&] {
        tell(false, QStringLiteral("blacklistedChanged"), QStringLiteral("Blacklisted: %1"));
    });
    QObject::connect(&store.certificates(), &Certificates::certificatesChanged, &wait, [&] {
        log.write(QStringLiteral("What the system trusts has changed"),
                  {{QStringLiteral("event"), QStringLiteral("systemChanged")}});
    });
    log.write(QStringLiteral("Watching the certificates."),
              {{QStringLiteral("event"), QStringLiteral("watching")}});
    return concludeWatch(wait.run());
}

Command command(const QString &name, const QString &summary, const QVector<Argument> &arguments,
                const QVector<Option> &options, const Run &run)
{
    Command command;
    command.name = name;
    command.summary = summary;
    command.arguments = arguments;
    command.options = options;
    command.run = [run](const Values &values) -> int {
        TrustStore store(timeoutsOf(values).confirmation);
        return run(store, values);
    };
    return command;
}

} // namespace

Command certificatesCommand()
{
    const Option timeout = timeoutOption(
        QStringLiteral("Give up when the phone has not finished after so many seconds (default: 25)"));
    const QVector<Option> putOptions{
        {nameName,
         QStringLiteral("What to call it on the phone (default: FILE's name, with .crt)"),
         nameArgument,
         {}},
        timeout};
    const Argument source{fileArgument,
                          QStringLiteral("Certificates in PEM or DER form; - reads standard input"),
                          {},
                          {},
                          Argument::File,
                          Argument::One};
    const Argument names{
        nameArgument,     QStringLiteral("The file's name on the phone"), {}, {}, Argument::Word,
        Argument::Several};

    Command list = command(
        QStringLiteral("list"), QStringLiteral("Show what is trusted and distrusted"), {},
        {{systemName, QStringLiteral("Show the authorities of the system as well"), {}, {}}, jsonOption()},
        runList);
    list.description = QStringLiteral(
        "JSON: {\"installed\": [{\"file\": \"company.crt\", \"certificates\": [{\"subject\": "
        "\"...\",\n\"issuer\": \"...\", \"effective\": \"2026-01-01T00:00:00Z\", \"expires\": "
        "\"...\", \"fingerprint\": \"...\"}]}],\n\"blacklisted\": [...]}, and with --system "
        "\"system\": [{\"subject\": ...}]. Fingerprints are of SHA-256.");
    Command show = command(
        QStringLiteral("show"), QStringLiteral("Show what is in a file"),
        {{nameArgument, QStringLiteral("The file's name on the phone"), {}, {}}},
        {{blacklistedName, QStringLiteral("Look among the distrusted files"), {}, {}}, jsonOption()},
        runShow);
    show.description
        = QStringLiteral("JSON: {\"file\": \"company.crt\", \"certificates\": [...]}, as in \"list\".");
    Command watch = command(QStringLiteral("watch"), QStringLiteral("Follow what changes"), {},
                            {jsonOption()}, runWatch);
    watch.description = QStringLiteral(
        "Prints one line a change until it is interrupted (Ctrl-C, exit status 0).\n\n"
        "JSON: one object a line with \"time\", \"event\" and \"files\"; the events are installedChanged,\n"
        "blacklistedChanged and systemChanged (without files), and {\"event\": \"watching\"} at the start.");

    Command certificates;
    certificates.name = QStringLiteral("certificates");
    certificates.summary = QStringLiteral("Choose which certificate authorities the phone trusts");
    certificates.description = QStringLiteral("Examples:\n"
                                              "  mdmctl certificates list\n"
                                              "  mdmctl certificates install company.pem\n"
                                              "  mdmctl certificates blacklist leaked.pem --name leaked.crt");
    certificates.commands = {
        list,
        show,
        command(QStringLiteral("install"), QStringLiteral("Make the phone trust certificates"), {source},
                putOptions, runPut(true)),
        command(QStringLiteral("uninstall"), QStringLiteral("Remove files that were installed"), {names},
                {timeout}, runRemove(true)),
        command(QStringLiteral("blacklist"), QStringLiteral("Make the phone distrust certificates"), {source},
                putOptions, runPut(false)),
        command(QStringLiteral("unblacklist"), QStringLiteral("Remove files of distrusted certificates"),
                {names}, {timeout}, runRemove(false)),
        watch,
    };
    return certificates;
}

} // namespace Agent
} // namespace Corvane
