// SPDX-License-Identifier: LGPL-2.1-or-later
#include <benchmark/benchmark.h>

#include <QtCore/QProcess>

namespace
{

void loadLibraries(benchmark::State &state, const QStringList &libraries)
{
    for (auto _ : state) {
        QProcess process;
        process.start(QStringLiteral(LOAD_TIME_PROGRAM), libraries);
        process.waitForFinished();
        if (process.exitCode() != 0) {
            state.SkipWithError(process.readAllStandardError().constData());
            return;
        }
        state.SetIterationTime(process.readAllStandardOutput().trimmed().toDouble() / 1e9);
    }
}

void loadLibrary(benchmark::State &state)
{
    loadLibraries(state, {QStringLiteral(LIBRARY_FILE)});
}

void loadDependencies(benchmark::State &state)
{
    loadLibraries(state,
                  {QStringLiteral("libQt5DBus.so.5"), QStringLiteral("libpackagekitqt5.so.1"),
                   QStringLiteral("librpm.so.9"), QStringLiteral(PLATFORM_LIBRARY_FILE)});
}

} // namespace

BENCHMARK(loadLibrary)->Name("load/library")->UseManualTime()->Unit(benchmark::kMicrosecond)->Iterations(60);
BENCHMARK(loadDependencies)
    ->Name("load/dependencies")
    ->UseManualTime()
    ->Unit(benchmark::kMicrosecond)
    ->Iterations(60);
