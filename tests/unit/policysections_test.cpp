// SPDX-License-Identifier: LGPL-2.1-or-later
#include <packagesection.h>
#include <policy.h>
#include <softwareupdatesection.h>
#include <warningcapture.h>

#include <QtCore/QJsonDocument>
#include <QtCore/QTemporaryFile>
#include <QtTest/QtTest>

using namespace Corvane::Agent;

class PolicySectionsTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void schemaAndSectionsNameTheSameMembers();
    void settingsComeFromThePolicyAlone();
    void repeatedRuleIsAFault();
    void packageAgainstTheInstalledOne_data();
    void packageAgainstTheInstalledOne();
    void updateAgainstTheOffer_data();
    void updateAgainstTheOffer();
    void reasonOfAWarning();
};

namespace
{

Policy read(const QByteArray &text, const PolicySections &sections)
{
    QTemporaryFile file;
    if (!file.open() || file.write(text) != text.size() || !file.flush())
        qFatal("cannot write the policy");
    Policy policy = readPolicy(file.fileName(), sections);
    policy.error.replace(file.fileName(), QStringLiteral("FILE"));
    return policy;
}

} // namespace

void PolicySectionsTest::schemaAndSectionsNameTheSameMembers()
{
    const QJsonObject schema = QJsonDocument::fromJson(policySchema()).object();
    QStringList members{QStringLiteral("$schema"), QStringLiteral("name"), QStringLiteral("description")};
    for (const auto &section : makePolicySections({}))
        members.append(section->member());
    members.sort();
    QCOMPARE(members, schema.value(QLatin1String("properties")).toObject().keys());
}

void PolicySectionsTest::settingsComeFromThePolicyAlone()
{
    const PolicySections sections = makePolicySections({});
    const Policy policy = read(R"({"calls": {"dial": {"rules": []}, "incoming": {"default": "hangup"}},
                                   "sms": {"default": "block"}, "data": {"rules": [{"imsi": "*", "action": "block"}]},
                                   "softwareUpdate": {"install": "5.1"}})",
                               sections);
    QCOMPARE(policy.error, QString());
    QStringList settings;
    for (const auto &section : sections) {
        for (const Setting &setting : section->settings(policy.settingsOf(*section)))
            settings.append(setting.path + QLatin1Char('=') + setting.wanted.text);
    }
    QCOMPARE(
        settings,
        QStringList({QStringLiteral("calls.dial.rules=no rules"),
                     QStringLiteral("calls.incoming.default=hangup"), QStringLiteral("sms.default=block"),
                     QStringLiteral("data.rules=*=block"), QStringLiteral("softwareUpdate.install=5.1")}));
}

void PolicySectionsTest::repeatedRuleIsAFault()
{
    const Policy policy = read(R"({"calls": {"incoming": {"rules": [{"imsi": "1", "action": "block"},
                                   {"imsi": "2", "action": "block"}, {"imsi": "1", "action": "allow"}]}}})",
                               makePolicySections({}));
    QCOMPARE(
        policy.error,
        QStringLiteral(R"(FILE: /calls/incoming/rules/2/imsi: must be named once; "1" has a rule already)"));
}

void PolicySectionsTest::packageAgainstTheInstalledOne_data()
{
    QTest::addColumn<QJsonValue>("wanted");
    QTest::addColumn<QString>("installed");
    QTest::addColumn<QString>("detail");
    const QJsonValue required(true);
    const QJsonValue forbidden(false);
    const QJsonValue pinned(QStringLiteral("1.2-3"));
    QTest::newRow("required, there") << required << "1.0"
                                     << "";
    QTest::newRow("required, missing") << required << ""
                                       << "install the newest version";
    QTest::newRow("forbidden, there") << forbidden << "1.0"
                                      << "remove it";
    QTest::newRow("forbidden, missing") << forbidden << ""
                                        << "";
    QTest::newRow("pinned, there") << pinned << "1.2"
                                   << "";
    QTest::newRow("pinned, there with a release") << pinned << "1.2-3"
                                                  << "";
    QTest::newRow("pinned, missing") << pinned << ""
                                     << "install 1.2-3";
    QTest::newRow("pinned, older") << pinned << "1.1"
                                   << "install 1.2-3";
    QTest::newRow("pinned, shorter") << pinned << "1"
                                     << "install 1.2-3";
    QTest::newRow("pinned, longer") << pinned << "1.20"
                                    << "install 1.2-3";
}

void PolicySectionsTest::packageAgainstTheInstalledOne()
{
    QFETCH(QJsonValue, wanted);
    QFETCH(QString, installed);
    QFETCH(QString, detail);
    Setting setting;
    setting.wanted.json = wanted;
    setting = PackageSection::compared(setting, installed);
    QCOMPARE(setting.detail, detail);
    QCOMPARE(setting.status, detail.isEmpty() ? Setting::Compliant : Setting::Different);
    QCOMPARE(setting.present.text, installed.isEmpty() ? QStringLiteral("not installed") : installed);
    QCOMPARE(setting.present.json.isNull(), installed.isEmpty());
}

void PolicySectionsTest::updateAgainstTheOffer_data()
{
    QTest::addColumn<QString>("wanted");
    QTest::addColumn<QString>("offered");
    QTest::addColumn<int>("status");
    QTest::addColumn<QString>("detail");

    QTest::newRow("latest, none") << "latest"
                                  << "" << int(Setting::Compliant) << "";
    QTest::newRow("latest, one") << "latest"
                                 << "5.1" << int(Setting::Different) << "install 5.1";
    QTest::newRow("fixed, none") << "5.1"
                                 << "" << int(Setting::Compliant) << "";
    QTest::newRow("fixed, that one") << "5.1"
                                     << "5.1" << int(Setting::Different) << "install 5.1";
    QTest::newRow("fixed, another") << "5.1"
                                    << "5.2" << int(Setting::Unsupported)
                                    << "the phone offers 5.2 and no other version";
}

void PolicySectionsTest::updateAgainstTheOffer()
{
    QFETCH(QString, wanted);
    QFETCH(QString, offered);
    Setting setting;
    setting.wanted = {wanted, wanted};
    const Setting compared = SoftwareUpdateSection::compared(setting, offered);
    QTEST(int(compared.status), "status");
    QTEST(compared.detail, "detail");
    QCOMPARE(compared.present.json, offered.isEmpty() ? QJsonValue() : QJsonValue(offered));
}

void PolicySectionsTest::reasonOfAWarning()
{
    QCOMPARE(WarningCapture::reasonOf(QStringLiteral(R"(Method call failed: "org.x.Error" "no room")")),
             QStringLiteral("no room (org.x.Error)"));
    QCOMPARE(WarningCapture::reasonOf(QStringLiteral(R"(Method call failed: "org.x.Error" "")")),
             QStringLiteral("org.x.Error"));
    QCOMPARE(
        WarningCapture::reasonOf(QStringLiteral(R"(Failed to ask QDBusError("org.x.Error", "no "such" x"))")),
        QStringLiteral(R"(no "such" x (org.x.Error))"));
    QCOMPARE(WarningCapture::reasonOf(QStringLiteral("something else")), QStringLiteral("something else"));
}

QTEST_APPLESS_MAIN(PolicySectionsTest)
#include "policysections_test.moc"
