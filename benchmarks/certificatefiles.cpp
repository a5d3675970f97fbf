// SPDX-License-Identifier: LGPL-2.1-or-later
#include <corvanemdm/certificates.h>

#include <benchmark/benchmark.h>

#include <QtCore/QDir>
#include <QtCore/QFile>

using Corvane::Mdm::CertificateFile;
using Corvane::Mdm::Certificates;

namespace
{

constexpr int Files = 150;
constexpr char Anchors[] = "/etc/pki/ca-trust/source/anchors";
constexpr char SystemBundle[] = "/usr/share/pki/ca-trust-source/ca-bundle.pem";

/** Fills the folder of the phone that installed files are in. */
bool writeFiles()
{
    QFile bundle{QLatin1String(SystemBundle)};
    if (!bundle.open(QIODevice::ReadOnly))
        return false;
    const QList<QSslCertificate> certificates = QSslCertificate::fromDevice(&bundle, QSsl::Pem);
    for (int i = 0; i < Files && !certificates.isEmpty(); ++i) {
        QFile file(QStringLiteral("%1/benchmark-%2.crt").arg(QLatin1String(Anchors)).arg(i));
        if (!file.open(QIODevice::WriteOnly) || file.write(certificates.first().toPem()) < 0)
            return false;
    }
    return !certificates.isEmpty();
}

int countCertificates(const QList<CertificateFile> &files)
{
    int count = 0;
    for (const CertificateFile &file : files)
        count += file.certificates().size();
    return count;
}

void listUnchanged(benchmark::State &state)
{
    if (!writeFiles())
        return state.SkipWithError("there is no trust store to fill");
    const Certificates certificates;
    countCertificates(certificates.installedFiles());
    for (auto _ : state)
        benchmark::DoNotOptimize(countCertificates(certificates.installedFiles()));
}

void listForTheFirstTime(benchmark::State &state)
{
    if (!writeFiles())
        return state.SkipWithError("there is no trust store to fill");
    for (auto _ : state) {
        const Certificates certificates;
        benchmark::DoNotOptimize(countCertificates(certificates.installedFiles()));
    }
}

void readByHand(benchmark::State &state)
{
    if (!writeFiles())
        return state.SkipWithError("there is no trust store to fill");
    for (auto _ : state) {
        int count = 0;
        const QFileInfoList files
            = QDir(QLatin1String(Anchors)).entryInfoList({QStringLiteral("*.crt")}, QDir::Files, QDir::Name);
        for (const QFileInfo &file : files)
            count += QSslCertificate::fromPath(file.filePath()).size();
        benchmark::DoNotOptimize(count);
    }
}

} // namespace

BENCHMARK(listUnchanged)->Name("certificates/unchanged")->Unit(benchmark::kMicrosecond);
BENCHMARK(listForTheFirstTime)->Name("certificates/first")->Unit(benchmark::kMicrosecond);
BENCHMARK(readByHand)->Name("certificates/by hand")->Unit(benchmark::kMicrosecond);
