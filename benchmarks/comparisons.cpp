// SPDX-License-Identifier: LGPL-2.1-or-later
// Runs the benchmarks and prints, as a Markdown table, what each of ours costs beside its equivalent.
#include <benchmark/benchmark.h>

#include <QtCore/QCoreApplication>

#include <cstdio>
#include <map>
#include <string>

namespace
{

/** Ours, what it is compared with, and the ratio that we aim for (0: none). */
struct Comparison {
    const char *what;
    const char *ours;
    const char *other;
    double aim;
};

constexpr Comparison Comparisons[] = {
    {"blocking query / raw QtDBus", "query/library", "query/QtDBus", 1.10},
    {"blocking query / sd-bus", "query/library", "query/sd-bus", 0},
    {"voice call filter until ready / hand-written QtDBus client", "ready/library", "ready/QtDBus", 1.5},
    {"states of 1 SIM / hand-written QtDBus client", "states/library/1", "states/QtDBus/1", 0},
    {"states of 2 SIMs / hand-written QtDBus client", "states/library/2", "states/QtDBus/2", 0},
    {"states of 8 SIMs / hand-written QtDBus client", "states/library/8", "states/QtDBus/8", 0},
    {"150 unchanged certificate files / reading them", "certificates/unchanged", "certificates/by hand",
     0.01},
    {"150 certificate files for the first time / reading them", "certificates/first", "certificates/by hand",
     0},
    {"whole list, 1,000 rules / demarshalling and copying it", "list/library/1000",
     "list/demarshal+copy/1000", 2},
    {"whole list, 10,000 rules / demarshalling and copying it", "list/library/10000",
     "list/demarshal+copy/10000", 2},
    {"whole list, 100,000 rules / demarshalling and copying it", "list/library/100000",
     "list/demarshal+copy/100000", 2},
    {"whole list, 100,000 rules / 10,000 rules", "list/library/100000", "list/library/10000", 12},
    {"one rule added to 10,000 / one copy of the list", "rule/library/10000", "rule/copy/10000", 4},
    {"1,000 notifications with nested actions / demarshalled by hand", "notifications/library/1000",
     "notifications/hand-read/1000", 0},
    {"1,000 notifications with nested actions / with these left unread", "notifications/library/1000",
     "notifications/unread/1000", 0},
    {"1,000 positions / hand-written QtDBus client", "positions/library/1000", "positions/QtDBus/1000", 0},
    {"10,000 packages / rpm -qa with the same fields", "packages/library", "packages/rpm", 1},
    {"10,000 packages / the loop over librpm alone", "packages/library", "packages/librpm", 0},
    {"500 applications / rpm -qf of their files in one process", "applications/library", "applications/rpm",
     1},
    {"access point written / the same eight writes through raw QtDBus", "accesspoint/library",
     "accesspoint/QtDBus", 0},
    {"access point written / the same eight writes through sd-bus", "accesspoint/library",
     "accesspoint/sd-bus", 0},
    {"proxy of 1 of 10 networks selected / walking their list", "selectproxy/library/10",
     "selectproxy/walk/10", 0},
    {"proxy of 1 of 100 networks selected / walking their list", "selectproxy/library/100",
     "selectproxy/walk/100", 0},
    {"proxy of 1 of 1,000 networks selected / walking their list", "selectproxy/library/1000",
     "selectproxy/walk/1000", 0},
    {"1,000 reports on data / reading their numbers", "usage/library/1000", "usage/numbers/1000", 0},
    {"loading the library / loading its dependencies", "load/library", "load/dependencies", 0},
};

struct Result {
    double microseconds = 0; // median of the repetitions
    double variation = 0; // their standard deviation by their mean
};

class ComparisonReporter : public benchmark::ConsoleReporter
{
public:
    void ReportRuns(const std::vector<Run> &runs) override
    {
        ConsoleReporter::ReportRuns(runs);
        for (const Run &run : runs) {
            // "name/real_time" and the like: the clock is not part of what is compared.
            const std::string name = run.run_name.function_name
                + (run.run_name.args.empty() ? std::string() : '/' + run.run_name.args);
            if (run.aggregate_name == "median")
                m_results[name].microseconds
                    = run.GetAdjustedRealTime() * 1e6 / benchmark::GetTimeUnitMultiplier(run.time_unit);
            else if (run.aggregate_name == "cv")
                m_results[name].variation
                    = run.real_accumulated_time; // no time, and of all repetitions together
        }
    }

    void Finalize() override
    {
        ConsoleReporter::Finalize();
        std::puts("\n| what / beside what | ours (us) | +- | other (us) | +- | ratio | aim |");
        std::puts("|---|---:|---:|---:|---:|---:|---:|");
        for (const Comparison &comparison : Comparisons) {
            const auto ours = m_results.find(comparison.ours);
            const auto other = m_results.find(comparison.other);
            if (ours == m_results.end() || other == m_results.end())
                continue; // filtered out
            char aim[16] = "";
            if (comparison.aim > 0)
                std::snprintf(aim, sizeof aim, "%.2f", comparison.aim);
            std::printf("| %s | %.1f | %.1f %% | %.1f | %.1f %% | **%.2f** | %s |\n", comparison.what,
                        ours->second.microseconds, 100 * ours->second.variation, other->second.microseconds,
                        100 * other->second.variation, ours->second.microseconds / other->second.microseconds,
                        aim);
        }
    }

private:
    std::map<std::string, Result> m_results;
};

} // namespace

int main(int argc, char **argv)
{
    QCoreApplication application(argc, argv);

    // Medians of interleaved repetitions: what else the machine does then hits both sides of a comparison.
    std::vector<char *> arguments(argv, argv + argc);
    std::string defaults[] = {"--benchmark_repetitions=9", "--benchmark_enable_random_interleaving=true",
                              "--benchmark_report_aggregates_only=true", "--benchmark_min_time=0.1"};
    for (std::string &argument : defaults)
        arguments.insert(arguments.begin() + 1, argument.data());
    int count = int(arguments.size());
    benchmark::Initialize(&count, arguments.data());
    if (benchmark::ReportUnrecognizedArguments(count, arguments.data()))
        return 2;

    ComparisonReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    return 0;
}
