// SPDX-License-Identifier: LGPL-2.1-or-later
#include "telephony/rulechannel_p.h"

#include <benchmark/benchmark.h>

#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>

using Corvane::Mdm::RuleChannel;
using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimFilterPrivate;

namespace
{

const QLatin1String Service("org.ofono");
const QLatin1String Path("/mdm/voicecallfilter/dial");
const QLatin1String Interface("org.corvaneos.ofono.mdm.VoiceCallFilter");

SimFilterPrivate::RulePrivateList makeRules(int count, qint64 firstImsi)
{
    SimFilterPrivate::RulePrivateList rules;
    rules.reserve(count);
    for (int index = 0; index < count; ++index)
        rules.append(SimFilter::Rule(QString::number(firstImsi + index), SimFilter::Action(1 + index % 2)));
    return rules;
}

/** The list as the service's own message has it, still to be demarshalled. */
QDBusArgument throughTheService(const SimFilterPrivate::RulePrivateList &rules)
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    QDBusMessage set = QDBusMessage::createMethodCall(Service, Path, Interface, QStringLiteral("SetRules"));
    set.setArguments({QVariant::fromValue(rules)});
    bus.call(set);
    const QDBusMessage all
        = bus.call(QDBusMessage::createMethodCall(Service, Path, Interface, QStringLiteral("GetAll")));
    bus.call(QDBusMessage::createMethodCall(Service, Path, Interface, QStringLiteral("ClearRules")));
    return all.arguments().at(2).value<QDBusArgument>();
}

/** Two lists that have no rule in common: an update from one to the other is the worst there is. */
struct Lists {
    explicit Lists(int count)
    {
        SimFilterPrivate::registerTypes();
        lists[0] = throughTheService(makeRules(count, 244050000000000));
        lists[1] = throughTheService(makeRules(count, 262020000000000));
    }

    SimFilterPrivate::RulePrivateList demarshalNext()
    {
        next = !next;
        const QDBusArgument unread = lists[next]; // reading advances the one that is read
        return qdbus_cast<SimFilterPrivate::RulePrivateList>(unread);
    }

    QDBusArgument lists[2];
    bool next = false;
};

void updateWholeList(benchmark::State &state)
{
    Lists lists(int(state.range(0)));
    QObject owner;
    RuleChannel channel({Path, Interface, "", ""}, RuleChannel::WithoutHangup, &owner);
    for (auto _ : state)
        channel.resetRules(lists.demarshalNext());
}

void demarshalAndCopyWholeList(benchmark::State &state)
{
    Lists lists(int(state.range(0)));
    for (auto _ : state) {
        const SimFilterPrivate::RulePrivateList rules = lists.demarshalNext();
        SimFilterPrivate::RulePrivateList copy = rules;
        copy.detach();
        benchmark::DoNotOptimize(copy);
    }
}

void addOneRule(benchmark::State &state)
{
    const int count = int(state.range(0));
    SimFilterPrivate::registerTypes();
    QObject owner;
    RuleChannel channel({Path, Interface, "", ""}, RuleChannel::WithoutHangup, &owner);
    channel.resetRules(makeRules(count, 244050000000000));
    const SimFilterPrivate::RulePrivate rule(SimFilter::Rule(QStringLiteral("1"), SimFilter::Allow));
    for (auto _ : state) {
        channel.ruleAdded(quint32(count / 2), rule);
        state.PauseTiming();
        channel.ruleRemoved(quint32(count / 2));
        state.ResumeTiming();
    }
}

void copyWholeList(benchmark::State &state)
{
    SimFilter::RuleList rules;
    for (const SimFilterPrivate::RulePrivate &rule : makeRules(int(state.range(0)), 244050000000000))
        rules.append(SimFilterPrivate::publicRuleFromPrivate(rule));
    for (auto _ : state) {
        SimFilter::RuleList copy = rules;
        copy.detach();
        benchmark::DoNotOptimize(copy);
    }
}

} // namespace

BENCHMARK(updateWholeList)
    ->Name("list/library")
    ->Arg(1000)
    ->Arg(10000)
    ->Arg(100000)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK(demarshalAndCopyWholeList)
    ->Name("list/demarshal+copy")
    ->Arg(1000)
    ->Arg(10000)
    ->Arg(100000)
    ->Unit(benchmark::kMicrosecond);
BENCHMARK(addOneRule)->Name("rule/library")->Arg(10000)->Unit(benchmark::kMicrosecond);
BENCHMARK(copyWholeList)->Name("rule/copy")->Arg(10000)->Unit(benchmark::kMicrosecond);
