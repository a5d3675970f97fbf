// SPDX-License-Identifier: LGPL-2.1-or-later
#include "telephony/simfilter_p.h"

#include <corvanemdm/simvoicecallfilter.h>

#include <benchmark/benchmark.h>

#include <QtCore/QEventLoop>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingCallWatcher>
#include <QtDBus/QDBusPendingReply>

using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimFilterPrivate;
using Corvane::Mdm::SimVoiceCallFilter;

/** The least that mirrors the same state: ten connections, two calls, and the lists taken over as they come.
 */
class HandWrittenFilter : public QObject
{
    Q_OBJECT

public:
    HandWrittenFilter()
    {
        for (const char *path : {"/mdm/voicecallfilter/dial", "/mdm/voicecallfilter/incoming"}) {
            follow(path, "RuleAdded", SLOT(ruleAdded(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)));
            follow(path, "RuleChanged",
                   SLOT(ruleAdded(quint32, Corvane::Mdm::SimFilterPrivate::RulePrivate)));
            follow(path, "RuleRemoved", SLOT(numberChanged(quint32)));
            follow(path, "RulesChanged", SLOT(rulesChanged(Corvane::Mdm::SimFilterPrivate::RulePrivateList)));
            follow(path, "DefaultActionChanged", SLOT(numberChanged(quint32)));
        }
        for (const char *path : {"/mdm/voicecallfilter/dial", "/mdm/voicecallfilter/incoming"}) {
            auto *watcher = new QDBusPendingCallWatcher(
                QDBusConnection::systemBus().asyncCall(QDBusMessage::createMethodCall(
                    QStringLiteral("org.ofono"), QLatin1String(path),
                    QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"), QStringLiteral("GetAll"))),
                this);
            connect(watcher, &QDBusPendingCallWatcher::finished, this, &HandWrittenFilter::takeAll);
        }
    }

Q_SIGNALS:
    void readyChanged();

private Q_SLOTS:
    void ruleAdded(quint32, const Corvane::Mdm::SimFilterPrivate::RulePrivate &) { }
    void numberChanged(quint32) { }
    void rulesChanged(const Corvane::Mdm::SimFilterPrivate::RulePrivateList &) { }

private:
    void follow(const char *path, const char *signal, const char *slot)
    {
        QDBusConnection::systemBus().connect(QStringLiteral("org.ofono"), QLatin1String(path),
                                             QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"),
                                             QLatin1String(signal), this, slot);
    }

    void takeAll(QDBusPendingCallWatcher *watcher)
    {
        const QDBusPendingReply<quint32, quint32, SimFilterPrivate::RulePrivateList> reply = *watcher;
        m_rules[m_answers++] = reply.argumentAt<2>();
        watcher->deleteLater();
        if (m_answers == 2)
            Q_EMIT readyChanged();
    }

    SimFilterPrivate::RulePrivateList m_rules[2];
    int m_answers = 0;
};

namespace
{

template <typename Filter> void becomeReady(benchmark::State &state)
{
    SimFilterPrivate::registerTypes();
    for (auto _ : state) {
        Filter filter;
        QEventLoop loop;
        QObject::connect(&filter, &Filter::readyChanged, &loop, &QEventLoop::quit);
        loop.exec();
    }
}

} // namespace

BENCHMARK_TEMPLATE(becomeReady, SimVoiceCallFilter)
    ->Name("ready/library")
    ->UseRealTime()
    ->Unit(benchmark::kMicrosecond);
BENCHMARK_TEMPLATE(becomeReady, HandWrittenFilter)
    ->Name("ready/QtDBus")
    ->UseRealTime()
    ->Unit(benchmark::kMicrosecond);

#include "filterreadiness.moc"
