// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("org.ofono");
const QString interface = QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter");
const QString dialPath = QStringLiteral("/mdm/voicecallfilter/dial");
const QString incomingPath = QStringLiteral("/mdm/voicecallfilter/incoming");
const QString done = QStringLiteral("reply()");
const QString firstImsi = QStringLiteral("244051234567890");
const QString secondImsi = QStringLiteral("262021234567891");

constexpr quint32 block = 1;
constexpr quint32 allow = 2;
constexpr quint32 hangUp = 3;

QVariant rules(const WireRules &list)
{
    return QVariant::fromValue(list);
}

} // namespace

/** The call filter objects of the simulated telephony daemon. */
class VoiceCallFilterServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void startsWithTheProfile();
    void appendsChangesAndKeepsRules();
    void removesRules();
    void replacesAndClearsTheList();
    void hasADefault();
    void refusesWhatIsNoRule_data();
    void refusesWhatIsNoRule();
    void takesTheOddestImsis();
    void answersBeforeItSignals();
    void keepsTheTwoDirectionsApart();
    void judgesCalls();
    void keepsRulesWhileStopped();
    void takesLongLists();

private:
    QString call(const QString &member, const QVariantList &arguments = {},
                 const QString &path = dialPath) const
    {
        return textOf(m_client->call(service, path, interface, member, arguments));
    }
    QString all(const QString &path = dialPath) const { return call(QStringLiteral("GetAll"), {}, path); }
    QStringList takeSignals() { return m_client->takeSignals(service); }

    std::unique_ptr<Client> m_client;
};

void VoiceCallFilterServiceTest::init()
{
    m_client = std::make_unique<Client>();
    for (const QString &path : {dialPath, incomingPath}) {
        call(QStringLiteral("ClearRules"), {}, path);
        call(QStringLiteral("SetDefaultAction"), {allow}, path);
    }
    m_client->watch(service, dialPath, interface,
                    {QStringLiteral("RuleAdded"), QStringLiteral("RuleChanged"),
                     QStringLiteral("RuleRemoved"), QStringLiteral("RulesChanged"),
                     QStringLiteral("DefaultActionChanged")});
}

void VoiceCallFilterServiceTest::cleanup()
{
    m_client.reset();
}

void VoiceCallFilterServiceTest::startsWithTheProfile()
{
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [])"));
    QCOMPARE(all(incomingPath), QStringLiteral("reply(1, 2, [])"));
}

void VoiceCallFilterServiceTest::appendsChangesAndKeepsRules()
{
    QCOMPARE(call(QStringLiteral("AddRule"), {firstImsi, block}), done);
    QCOMPARE(call(QStringLiteral("AddRule"), {secondImsi, allow}), done);
    QCOMPARE(call(QStringLiteral("AddRule"), {secondImsi, allow}), done);
    QCOMPARE(call(QStringLiteral("AddRule"), {firstImsi, allow}), done);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("RuleAdded(0, (244051234567890, 1))"),
                          QStringLiteral("RuleAdded(1, (262021234567891, 2))"),
                          QStringLiteral("RuleChanged(0, (244051234567890, 2))")}));
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(244051234567890, 2), (262021234567891, 2)])"));
}

void VoiceCallFilterServiceTest::removesRules()
{
    call(QStringLiteral("SetRules"), {rules({{firstImsi, block}, {secondImsi, block}})});
    takeSignals();
    QCOMPARE(call(QStringLiteral("RemoveRule"), {secondImsi}), done);
    QCOMPARE(call(QStringLiteral("RemoveRule"), {secondImsi}),
             QStringLiteral("org.ofono.Error.NotFound: There is no rule for \"262021234567891\""));
    QCOMPARE(takeSignals(), QStringList{QStringLiteral("RuleRemoved(1)")});
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(244051234567890, 1)])"));
}

void VoiceCallFilterServiceTest::replacesAndClearsTheList()
{
    const QVariant list = rules({{secondImsi, block}, {firstImsi, allow}});
    QCOMPARE(call(QStringLiteral("ClearRules")), done);
    QCOMPARE(call(QStringLiteral("SetRules"), {list}), done);
    QCOMPARE(call(QStringLiteral("SetRules"), {list}), done);
    QCOMPARE(call(QStringLiteral("SetRules"), {rules({{firstImsi, allow}, {secondImsi, block}})}), done);
    QCOMPARE(call(QStringLiteral("ClearRules")), done);
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("RulesChanged([(262021234567891, 1), (244051234567890, 2)])"),
                          QStringLiteral("RulesChanged([(244051234567890, 2), (262021234567891, 1)])"),
                          QStringLiteral("RulesChanged([])")}));
}

void VoiceCallFilterServiceTest::hasADefault()
{
    QCOMPARE(call(QStringLiteral("SetDefaultAction"), {allow}), done);
    QCOMPARE(call(QStringLiteral("SetDefaultAction"), {block}), done);
    QCOMPARE(takeSignals(), QStringList{QStringLiteral("DefaultActionChanged(1)")});
    QCOMPARE(all(), QStringLiteral("reply(1, 1, [])"));
}

void VoiceCallFilterServiceTest::refusesWhatIsNoRule_data()
{
    QTest::addColumn<QString>("path");
    QTest::addColumn<QString>("member");
    QTest::addColumn<QVariantList>("arguments");

    const QString add = QStringLiteral("AddRule");
    const QString set = QStringLiteral("SetRules");
    const QString setDefault = QStringLiteral("SetDefaultAction");
    QTest::newRow("letters") << dialPath << add << QVariantList{QStringLiteral("24405x"), block};
    QTest::newRow("16 digits") << dialPath << add << QVariantList{QStringLiteral("2440512345678901"), block};
    QTest::newRow("other digits") << dialPath << add << QVariantList{QString(QChar(0x0664)), block};
    QTest::newRow("action 0") << dialPath << add << QVariantList{firstImsi, 0u};
    QTest::newRow("action 3 dialled") << dialPath << add << QVariantList{firstImsi, hangUp};
    QTest::newRow("action 4") << incomingPath << add << QVariantList{firstImsi, 4u};
    QTest::newRow("one of a list") << dialPath << set
                                   << QVariantList{rules({{secondImsi, allow}, {firstImsi, hangUp}})};
    QTest::newRow("twice in a list") << dialPath << set
                                     << QVariantList{rules({{firstImsi, allow}, {firstImsi, block}})};
    QTest::newRow("default 0") << dialPath << setDefault << QVariantList{0u};
    QTest::newRow("default 3 dialled") << dialPath << setDefault << QVariantList{hangUp};
    QTest::newRow("default 4") << incomingPath << setDefault << QVariantList{4u};
}

void VoiceCallFilterServiceTest::refusesWhatIsNoRule()
{
    QFETCH(QString, path);
    QFETCH(QString, member);
    QFETCH(QVariantList, arguments);

    const QString before = all(path);
    const QString answer = call(member, arguments, path);
    QVERIFY2(answer.startsWith(QLatin1String("org.ofono.Error.InvalidArguments: ")), qPrintable(answer));
    QCOMPARE(all(path), before);
    QCOMPARE(takeSignals(), QStringList());
}

void VoiceCallFilterServiceTest::takesTheOddestImsis()
{
    QCOMPARE(call(QStringLiteral("AddRule"), {QString(), block}), done);
    QCOMPARE(call(QStringLiteral("AddRule"), {QStringLiteral("0"), allow}), done);
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(, 1), (0, 2)])"));
}

void VoiceCallFilterServiceTest::answersBeforeItSignals()
{
    m_client->callAndNote(service, dialPath, interface, QStringLiteral("AddRule"), {firstImsi, block});
    QVERIFY(m_client->waitForSignals(2));
    QCOMPARE(takeSignals(),
             (QStringList{QStringLiteral("answer"), QStringLiteral("RuleAdded(0, (244051234567890, 1))")}));
}

void VoiceCallFilterServiceTest::keepsTheTwoDirectionsApart()
{
    QCOMPARE(call(QStringLiteral("AddRule"), {firstImsi, hangUp}, incomingPath), done);
    QCOMPARE(call(QStringLiteral("SetDefaultAction"), {hangUp}, incomingPath), done);
    QCOMPARE(all(incomingPath), QStringLiteral("reply(1, 3, [(244051234567890, 3)])"));
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [])"));
    QCOMPARE(takeSignals(), QStringList());
}

void VoiceCallFilterServiceTest::judgesCalls()
{
    const auto judge = [this](const QString &direction, const QStringList &arguments) {
        return textOf(
            m_client->control(QStringLiteral("Act"), {QStringLiteral("call ") + direction, arguments}));
    };
    const QString dial = QStringLiteral("dial");
    const QString incoming = QStringLiteral("incoming");
    call(QStringLiteral("AddRule"), {firstImsi, block});
    call(QStringLiteral("AddRule"), {secondImsi, hangUp}, incomingPath);

    QCOMPARE(judge(dial, {QStringLiteral("0"), QStringLiteral("+358501234567")}),
             QStringLiteral("reply(block (rule 0, for 244051234567890))"));
    QCOMPARE(judge(dial, {secondImsi}), QStringLiteral("reply(allow (default action))"));
    QCOMPARE(judge(incoming, {QStringLiteral("1")}),
             QStringLiteral("reply(hangup (rule 0, for 262021234567891))"));

    m_client->control(QStringLiteral("Act"), {QStringLiteral("sim pull"), QStringList{QStringLiteral("1")}});
    QCOMPARE(judge(incoming, {QStringLiteral("1")}),
             QStringLiteral(
                 "org.corvaneos.simulator.Error.InvalidArguments: There is no SIM in slot 1; insert one or "
                 "name an IMSI"));
    m_client->control(QStringLiteral("Act"),
                      {QStringLiteral("sim insert"), QStringList{QStringLiteral("1")}});
}

void VoiceCallFilterServiceTest::keepsRulesWhileStopped()
{
    call(QStringLiteral("AddRule"), {firstImsi, block});
    m_client->control(QStringLiteral("StopService"), {service});
    QVERIFY(all().startsWith(QLatin1String("org.freedesktop.DBus.Error.ServiceUnknown")));
    m_client->control(QStringLiteral("StartService"), {service});
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(244051234567890, 1)])"));
}

void VoiceCallFilterServiceTest::takesLongLists()
{
    WireRules list;
    for (int i = 0; i < 100000; ++i)
        list << WireRule{QString::number(100000000000000 + i), block};
    QCOMPARE(call(QStringLiteral("SetRules"), {rules(list)}), done);
    QVERIFY(m_client->waitForSignals(1));
    const QDBusMessage answer = m_client->call(service, dialPath, interface, QStringLiteral("GetAll"));
    QCOMPARE(qdbus_cast<WireRules>(answer.arguments().at(2)).size(), list.size());
}

QTEST_GUILESS_MAIN(VoiceCallFilterServiceTest)
#include "voicecallfilterservice_test.moc"
