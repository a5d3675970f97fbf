// SPDX-License-Identifier: LGPL-2.1-or-later
#include "client.h"

#include <QtTest/QTest>

namespace
{

const QString service = QStringLiteral("org.ofono");
const QString done = QStringLiteral("reply()");
const QString firstImsi = QStringLiteral("244051234567890");
const QString secondImsi = QStringLiteral("262021234567891");

constexpr quint32 block = 1;
constexpr quint32 allow = 2;
constexpr quint32 hangUp = 3;

/** The rules for one kind of traffic. */
struct Object {
    QString path;
    QString interface;
    QString word; ///< in the members of the interface
    QString action; ///< that tells what happens to the traffic
    bool hangsUp;
};

const Object dial{QStringLiteral("/mdm/voicecallfilter/dial"),
                  QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"), QString(),
                  QStringLiteral("call dial"), false};
const Object incoming{QStringLiteral("/mdm/voicecallfilter/incoming"),
                      QStringLiteral("org.corvaneos.ofono.mdm.VoiceCallFilter"), QString(),
                      QStringLiteral("call incoming"), true};
const Object textIn{QStringLiteral("/mdm/smsfilter/textin"),
                    QStringLiteral("org.corvaneos.ofono.mdm.SmsFilter"), QStringLiteral("Text"),
                    QStringLiteral("text"), false};
const Object gprs{QStringLiteral("/mdm/gprsfilter"), QStringLiteral("org.corvaneos.ofono.mdm.GprsFilter"),
                  QString(), QStringLiteral("data"), false};

QVariant rules(const WireRules &list)
{
    return QVariant::fromValue(list);
}

} // namespace

Q_DECLARE_METATYPE(Object)

/** The filter objects of the simulated telephony daemon; each test runs on each of them. */
class RuleFiltersServiceTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void initTestCase_data();
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
    void keepsTheObjectsApart();
    void judgesTraffic();
    void keepsRulesWhileStopped();
    void takesLongLists();

private:
    QString call(const char *member, const QVariantList &arguments = {}) const
    {
        return callOf(m_object, member, arguments);
    }
    QString callOf(const Object &object, const char *member, const QVariantList &arguments = {}) const
    {
        return textOf(
            m_client->call(service, object.path, object.interface, nameIn(object, member), arguments));
    }
    /** @p text with the word of the object's interface in place of "@". */
    static QString nameIn(const Object &object, const char *text)
    {
        return QString::fromLatin1(text).replace(QLatin1Char('@'), object.word);
    }
    QStringList names(std::initializer_list<const char *> list) const
    {
        QStringList result;
        for (const char *text : list)
            result.append(nameIn(m_object, text));
        return result;
    }
    QString all() const { return call("GetAll"); }
    QStringList takeSignals() { return m_client->takeSignals(service); }

    Object m_object;
    std::unique_ptr<Client> m_client;
};

void RuleFiltersServiceTest::initTestCase_data()
{
    QTest::addColumn<Object>("object");
    for (const Object &object : {dial, incoming, textIn, gprs})
        QTest::newRow(qPrintable(object.path)) << object;
}

void RuleFiltersServiceTest::init()
{
    QFETCH_GLOBAL(Object, object);
    m_object = object;
    m_client = std::make_unique<Client>();
    call("Clear@Rules");
    call("SetDefault@Action", {allow});
    m_client->watch(
        service, object.path, object.interface,
        names({"@RuleAdded", "@RuleChanged", "@RuleRemoved", "@RulesChanged", "Default@ActionChanged"}));
    // What came of the two calls may still be on its way.
    takeSignals();
}

void RuleFiltersServiceTest::cleanup()
{
    m_client.reset();
}

void RuleFiltersServiceTest::startsWithTheProfile()
{
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [])"));
}

void RuleFiltersServiceTest::appendsChangesAndKeepsRules()
{
    QCOMPARE(call("Add@Rule", {firstImsi, block}), done);
    QCOMPARE(call("Add@Rule", {secondImsi, allow}), done);
    QCOMPARE(call("Add@Rule", {secondImsi, allow}), done);
    QCOMPARE(call("Add@Rule", {firstImsi, allow}), done);
    QCOMPARE(takeSignals(),
             names({"@RuleAdded(0, (244051234567890, 1))", "@RuleAdded(1, (262021234567891, 2))",
                    "@RuleChanged(0, (244051234567890, 2))"}));
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(244051234567890, 2), (262021234567891, 2)])"));
}

void RuleFiltersServiceTest::removesRules()
{
    call("Set@Rules", {rules({{firstImsi, block}, {secondImsi, block}})});
    takeSignals();
    QCOMPARE(call("Remove@Rule", {secondImsi}), done);
    QCOMPARE(call("Remove@Rule", {secondImsi}),
             QStringLiteral("org.ofono.Error.NotFound: There is no rule for \"262021234567891\""));
    QCOMPARE(takeSignals(), names({"@RuleRemoved(1)"}));
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(244051234567890, 1)])"));
}

void RuleFiltersServiceTest::replacesAndClearsTheList()
{
    const QVariant list = rules({{secondImsi, block}, {firstImsi, allow}});
    QCOMPARE(call("Clear@Rules"), done);
    QCOMPARE(call("Set@Rules", {list}), done);
    QCOMPARE(call("Set@Rules", {list}), done);
    QCOMPARE(call("Set@Rules", {rules({{firstImsi, allow}, {secondImsi, block}})}), done);
    QCOMPARE(call("Clear@Rules"), done);
    QCOMPARE(takeSignals(),
             names({"@RulesChanged([(262021234567891, 1), (244051234567890, 2)])",
                    "@RulesChanged([(244051234567890, 2), (262021234567891, 1)])", "@RulesChanged([])"}));
}

void RuleFiltersServiceTest::hasADefault()
{
    QCOMPARE(call("SetDefault@Action", {allow}), done);
    QCOMPARE(call("SetDefault@Action", {block}), done);
    QCOMPARE(takeSignals(), names({"Default@ActionChanged(1)"}));
    QCOMPARE(all(), QStringLiteral("reply(1, 1, [])"));
}

void RuleFiltersServiceTest::refusesWhatIsNoRule_data()
{
    QTest::addColumn<QByteArray>("member");
    QTest::addColumn<QVariantList>("arguments");
    QTest::addColumn<bool>("isHangUp");

    const QByteArray add("Add@Rule");
    const QByteArray set("Set@Rules");
    const QByteArray setDefault("SetDefault@Action");
    QTest::newRow("letters") << add << QVariantList{QStringLiteral("24405x"), block} << false;
    QTest::newRow("16 digits") << add << QVariantList{QStringLiteral("2440512345678901"), block} << false;
    QTest::newRow("other digits") << add << QVariantList{QString(QChar(0x0664)), block} << false;
    QTest::newRow("action 0") << add << QVariantList{firstImsi, 0u} << false;
    QTest::newRow("action 3") << add << QVariantList{firstImsi, hangUp} << true;
    QTest::newRow("action 4") << add << QVariantList{firstImsi, 4u} << false;
    QTest::newRow("one of a list") << set << QVariantList{rules({{secondImsi, allow}, {firstImsi, hangUp}})}
                                   << true;
    QTest::newRow("twice in a list") << set << QVariantList{rules({{firstImsi, allow}, {firstImsi, block}})}
                                     << false;
    QTest::newRow("default 0") << setDefault << QVariantList{0u} << false;
    QTest::newRow("default 3") << setDefault << QVariantList{hangUp} << true;
    QTest::newRow("default 4") << setDefault << QVariantList{4u} << false;
}

void RuleFiltersServiceTest::refusesWhatIsNoRule()
{
    QFETCH(QByteArray, member);
    QFETCH(QVariantList, arguments);
    QFETCH(bool, isHangUp);

    const QString before = all();
    const QString answer = call(member.constData(), arguments);
    if (isHangUp && m_object.hangsUp) {
        QCOMPARE(answer, done);
        return;
    }
    QVERIFY2(answer.startsWith(QLatin1String("org.ofono.Error.InvalidArguments: ")), qPrintable(answer));
    QCOMPARE(all(), before);
    QCOMPARE(takeSignals(), QStringList());
}

void RuleFiltersServiceTest::takesTheOddestImsis()
{
    QCOMPARE(call("Add@Rule", {QString(), block}), done);
    QCOMPARE(call("Add@Rule", {QStringLiteral("0"), allow}), done);
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(, 1), (0, 2)])"));
}

void RuleFiltersServiceTest::answersBeforeItSignals()
{
    m_client->callAndNote(service, m_object.path, m_object.interface, nameIn(m_object, "Add@Rule"),
                          {firstImsi, block});
    QVERIFY(m_client->waitForSignals(2));
    QCOMPARE(takeSignals(), names({"answer", "@RuleAdded(0, (244051234567890, 1))"}));
}

void RuleFiltersServiceTest::keepsTheObjectsApart()
{
    for (const Object &other : {dial, incoming, textIn, gprs}) {
        if (other.path == m_object.path)
            continue;
        QCOMPARE(callOf(other, "Clear@Rules"), done);
        QCOMPARE(callOf(other, "Add@Rule", {firstImsi, block}), done);
        QCOMPARE(callOf(other, "SetDefault@Action", {block}), done);
        QCOMPARE(callOf(other, "GetAll"), QStringLiteral("reply(1, 1, [(244051234567890, 1)])"));
    }
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [])"));
    QCOMPARE(takeSignals(), QStringList());
}

void RuleFiltersServiceTest::judgesTraffic()
{
    const auto act = [this](const QString &action, const QStringList &arguments) {
        return textOf(m_client->control(QStringLiteral("Act"), {action, arguments}));
    };
    const auto judge = [&](const QString &sim) {
        return act(m_object.action, {sim});
    };
    call("Add@Rule", {firstImsi, block});
    QCOMPARE(judge(QStringLiteral("0")), QStringLiteral("reply(block (rule 0, for 244051234567890))"));
    QCOMPARE(judge(secondImsi), QStringLiteral("reply(allow (default action))"));
    if (m_object.hangsUp) {
        call("Add@Rule", {secondImsi, hangUp});
        QCOMPARE(judge(QStringLiteral("1")), QStringLiteral("reply(hangup (rule 1, for 262021234567891))"));
    }
    if (m_object.path == gprs.path) {
        QCOMPARE(
            act(m_object.action, {firstImsi, QStringLiteral("+358501234567")}),
            QStringLiteral("org.corvaneos.simulator.Error.InvalidArguments: \"data\" takes IMSI|SLOT; it was "
                           "given 2 arguments"));
    } else {
        QCOMPARE(act(m_object.action, {firstImsi, QStringLiteral("+358501234567")}),
                 QStringLiteral("reply(block (rule 0, for 244051234567890))"));
    }

    act(QStringLiteral("sim pull"), {QStringLiteral("1")});
    QCOMPARE(judge(QStringLiteral("1")),
             QStringLiteral(
                 "org.corvaneos.simulator.Error.InvalidArguments: There is no SIM in slot 1; insert one or "
                 "name an IMSI"));
    act(QStringLiteral("sim insert"), {QStringLiteral("1")});
}

void RuleFiltersServiceTest::keepsRulesWhileStopped()
{
    call("Add@Rule", {firstImsi, block});
    m_client->control(QStringLiteral("StopService"), {service});
    QVERIFY(all().startsWith(QLatin1String("org.freedesktop.DBus.Error.ServiceUnknown")));
    m_client->control(QStringLiteral("StartService"), {service});
    QCOMPARE(all(), QStringLiteral("reply(1, 2, [(244051234567890, 1)])"));
}

void RuleFiltersServiceTest::takesLongLists()
{
    WireRules list;
    for (int i = 0; i < 25000; ++i)
        list << WireRule{QString::number(100000000000000 + i), block};
    QCOMPARE(call("Set@Rules", {rules(list)}), done);
    QVERIFY(m_client->waitForSignals(1));
    const QDBusMessage answer
        = m_client->call(service, m_object.path, m_object.interface, QStringLiteral("GetAll"));
    QCOMPARE(qdbus_cast<WireRules>(answer.arguments().at(2)).size(), list.size());
}

QTEST_GUILESS_MAIN(RuleFiltersServiceTest)
#include "rulefiltersservice_test.moc"
