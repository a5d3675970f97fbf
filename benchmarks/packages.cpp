// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/applications.h>

#include <benchmark/benchmark.h>

#include <QtCore/QDir>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtCore/QProcess>

#include <rpm/header.h>
#include <rpm/rpmdb.h>
#include <rpm/rpmlib.h>
#include <rpm/rpmts.h>

using Corvane::Mdm::Applications;

namespace
{

constexpr int PackageCount = 10000;
constexpr int ApplicationCount = 500;

const QString Format = QStringLiteral("%{NAME} %{VERSION} %{VENDOR}\n");

QString entryFile(int number)
{
    return QStringLiteral("/usr/share/applications/application-%1.desktop").arg(number);
}

void writeFile(const QString &path, const QByteArray &content)
{
    QFile file(path);
    if (!file.open(QIODevice::WriteOnly) || file.write(content) != content.size())
        qFatal("cannot write %s (run the benchmarks inside corvane-simulator)", qPrintable(path));
}

/** Fills the database of the phone, and its applications, once. @return the desktop entries */
const QStringList &manyPackages()
{
    static QStringList entries;
    if (!entries.isEmpty())
        return entries;
    QDir().mkpath(QStringLiteral("/usr/share/icons/hicolor/128x128/apps"));
    QJsonArray packages;
    for (int number = 0; number < PackageCount; ++number) {
        const QString name = QStringLiteral("application-%1").arg(number);
        QJsonArray files{QStringLiteral("/usr/bin/") + name, QStringLiteral("/usr/share/%1/data").arg(name)};
        if (number < ApplicationCount) {
            entries.append(entryFile(number));
            files.append(entries.last());
            writeFile(entries.last(),
                      "[Desktop Entry]\nType=Application\nName=Application\nExec=application\nIcon="
                          + name.toUtf8() + "\nCategories=Utility;\n");
            writeFile(QStringLiteral("/usr/share/icons/hicolor/128x128/apps/%1.png").arg(name), "x");
        }
        packages.append(QJsonObject{{QStringLiteral("name"), name},
                                    {QStringLiteral("version"), QStringLiteral("1.%1.0").arg(number)},
                                    {QStringLiteral("vendor"), QStringLiteral("Acme")},
                                    {QStringLiteral("files"), files}});
    }
    QProcess database;
    database.start(QStringLiteral("corvane-package-database"), {QStringLiteral("add")});
    database.write(QJsonDocument(packages).toJson(QJsonDocument::Compact));
    database.closeWriteChannel();
    if (!database.waitForFinished(-1) || database.exitCode() != 0)
        qFatal("the package database cannot be filled");
    return entries;
}

void listPackages(benchmark::State &state)
{
    manyPackages();
    const Applications applications;
    for (auto _ : state) {
        if (applications.getInstalledPackages().size() < PackageCount)
            state.SkipWithError("there are packages missing");
    }
}

/** The same three fields, as C strings. */
void listPackagesWithLibrpm(benchmark::State &state)
{
    manyPackages();
    rpmReadConfigFiles(nullptr, nullptr);
    for (auto _ : state) {
        const rpmts transactions = rpmtsCreate();
        const rpmdbMatchIterator all = rpmtsInitIterator(transactions, RPMDBI_PACKAGES, nullptr, 0);
        while (const Header header = rpmdbNextIterator(all)) {
            benchmark::DoNotOptimize(headerGetString(header, RPMTAG_NAME));
            benchmark::DoNotOptimize(headerGetString(header, RPMTAG_VERSION));
            benchmark::DoNotOptimize(headerGetString(header, RPMTAG_VENDOR));
        }
        rpmdbFreeIterator(all);
        rpmtsFree(transactions);
    }
}

void runRpm(benchmark::State &state, const QStringList &arguments, int lines)
{
    for (auto _ : state) {
        QProcess rpm;
        rpm.start(QStringLiteral("rpm"), arguments);
        rpm.waitForFinished(-1);
        if (rpm.readAllStandardOutput().count('\n') < lines)
            state.SkipWithError("rpm tells too little");
    }
}

void listPackagesWithRpm(benchmark::State &state)
{
    manyPackages();
    runRpm(state, {QStringLiteral("-qa"), QStringLiteral("--qf"), Format}, PackageCount);
}

void listApplications(benchmark::State &state)
{
    manyPackages();
    const Applications applications;
    for (auto _ : state) {
        const auto entries = applications.getInstalledApplications();
        if (entries.size() < ApplicationCount || !entries.last().package().isValid())
            state.SkipWithError("there are applications missing");
    }
}

void ownersWithRpm(benchmark::State &state)
{
    runRpm(state, QStringList{QStringLiteral("-qf"), QStringLiteral("--qf"), Format} + manyPackages(),
           ApplicationCount);
}

} // namespace

BENCHMARK(listPackages)->Name("packages/library")->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(listPackagesWithLibrpm)->Name("packages/librpm")->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(listPackagesWithRpm)->Name("packages/rpm")->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(listApplications)->Name("applications/library")->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(ownersWithRpm)->Name("applications/rpm")->UseRealTime()->Unit(benchmark::kMillisecond);
