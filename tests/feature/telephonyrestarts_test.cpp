// SPDX-License-Identifier: LGPL-2.1-or-later
#include "endurance.h"
#include "phone.h"
#include "servicerestarts.h"
#include "signalsequence.h"
#include "waiting.h"

#include <corvanemdm/siminfo.h>
#include <corvanemdm/simmobiledatafilter.h>
#include <corvanemdm/simsmsfilter.h>
#include <corvanemdm/simvoicecallfilter.h>

#include <QtCore/QElapsedTimer>
#include <QtCore/QRandomGenerator>
#include <QtTest/QtTest>

using Corvane::Mdm::SimFilter;
using Corvane::Mdm::SimInfo;
using Corvane::Mdm::SimMobileDataFilter;
using Corvane::Mdm::SimSmsFilter;
using Corvane::Mdm::SimVoiceCallFilter;

namespace
{

const QString Service = QStringLiteral("org.ofono");
const QStringList Expected{
    QStringLiteral("/ril_0 present voice data enabled pin:0 net:1 244051234567890"),
    QStringLiteral("/ril_1 present enabled pin:0 net:1 262021234567891"),
};
constexpr int LongestRunMicroseconds = 40000; // somewhat longer than until all states are known

QStringList stateTexts(const SimInfo &info)
{
    QStringList result;
    const QList<SimInfo::SimState> states = info.simSlotStates();
    for (const SimInfo::SimState &state : states)
        result.append(simStateText(state));
    return result;
}

/** Whether both slots have come to their states; before that the ones of the run before are kept. */
bool isTakenUp(const QStringList &signalsSeen)
{
    for (const QString &state : Expected) {
        if (!signalsSeen.contains(QStringLiteral("simStateChanged(%1)").arg(state)))
            return false;
    }
    return true;
}

} // namespace

/** The telephony service goes away at moments that nobody chose, the same ones in every run of the test. */
class TelephonyRestartsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void objectsSurvive();
};

void TelephonyRestartsTest::objectsSurvive()
{
    Phone phone;
    ServiceRestarts restarts(phone, Service, LongestRunMicroseconds);

    SimInfo info;
    SimVoiceCallFilter calls;
    SimSmsFilter texts;
    SimMobileDataFilter data;
    const SimFilter::Rule rule(QStringLiteral("244051234567890"), SimFilter::Block);
    const auto filtersAreReady = [&] {
        return calls.ready() && texts.ready() && data.ready();
    };
    const auto filtersHaveTheRule = [&] {
        const SimFilter::RuleList rules{rule};
        return calls.dialRules() == rules && texts.textRules() == rules && data.rules() == rules;
    };
    QVERIFY(waitUntil([&] { return filtersAreReady() && stateTexts(info) == Expected; }));
    QVERIFY(calls.setDialRule(rule));
    QVERIFY(texts.setTextRule(rule));
    QVERIFY(data.setRule(rule));
    QVERIFY(waitUntil(filtersHaveTheRule));

    SignalSequence seen(&info);
    int cutShort = 0;
    qint64 slowest = 0;
    for (int round = 0; round < restarts.rounds(); ++round) {
        restarts.stop();
        QVERIFY(waitUntil([&] { return !info.available(); }));
        QCOMPARE(info.simSlotStates().size(), 2);
        QVERIFY(filtersAreReady());
        QVERIFY(filtersHaveTheRule());

        // A run that ends at any point of taking up the service...
        seen.take();
        restarts.runBriefly();
        cutShort += isTakenUp(seen.take()) ? 0 : 1;

        // ... and one that lasts.
        restarts.start();
        QElapsedTimer elapsed;
        elapsed.start();
        QVERIFY2(waitUntil([&] { return isTakenUp(seen.signalsSeen()); }),
                 qPrintable(seen.take().join(QLatin1Char('\n'))));
        slowest = qMax(slowest, elapsed.elapsed());
        phone.settle(Service);
        QCOMPARE(stateTexts(info), Expected);
        QVERIFY(filtersAreReady());
        QVERIFY(filtersHaveTheRule());

        // The objects still work: what happens now is told once.
        seen.take();
        phone.act(QStringLiteral("network"), {QStringLiteral("1"), QStringLiteral("roaming")});
        QVERIFY(seen.waitFor(1));
        phone.act(QStringLiteral("network"), {QStringLiteral("1"), QStringLiteral("registered")});
        QVERIFY(seen.waitFor(2));
        phone.settle(Service);
        QCOMPARE(seen.take().size(), 2);
        restarts.endRound();
    }
    qInfo("%s, %d runs of the service cut short while it was taken up, slowest return to all states %lld ms",
          qPrintable(restarts.summary()), cutShort, slowest);
}

QTEST_GUILESS_MAIN(TelephonyRestartsTest)

#include "telephonyrestarts_test.moc"
