// SPDX-License-Identifier: LGPL-2.1-or-later
#include "mdmctl.h"
#include "phone.h"

#include <QtTest/QtTest>

namespace
{

/** The commands that the help lists. */
QStringList families()
{
    const QString help = Mdmctl::run({QStringLiteral("--help")}).output;
    const int begin = help.indexOf(QStringLiteral("Commands:\n"));
    const QString list = help.mid(begin, help.indexOf(QStringLiteral("\n\n"), begin) - begin);
    QStringList names;
    const QStringList lines = list.split(QLatin1Char('\n')).mid(1);
    for (const QString &line : lines)
        names.append(line.simplified().section(QLatin1Char(' '), 0, 0));
    return names;
}

} // namespace

/** Help, mistakes and completion: what mdmctl does without asking the phone anything. */
class MdmctlUsageTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void helpTeachesAtEachLevel_data();
    void helpTeachesAtEachLevel();
    void tellsItsVersion();
    void mistakesAreToldInOneLine_data();
    void mistakesAreToldInOneLine();
    void bashCompletes_data();
    void bashCompletes();
    void outputThatCannotBeWrittenIsAFailure();

private:
    Phone m_phone;
};

namespace
{

QStringList words(const char *text)
{
    return QString::fromUtf8(text).split(QLatin1Char(' '), Qt::SkipEmptyParts);
}

} // namespace

void MdmctlUsageTest::init()
{
    m_phone.takeJournal(QStringLiteral("org.ofono"));
}

void MdmctlUsageTest::cleanup()
{
    QCOMPARE(m_phone.takeJournal(QStringLiteral("org.ofono")), QStringList());
    QCOMPARE(m_phone.takeJournal(QStringLiteral("org.corvaneos.mdmproxy")), QStringList());
}

void MdmctlUsageTest::helpTeachesAtEachLevel_data()
{
    QTest::addColumn<QString>("command");
    QTest::addColumn<QStringList>("parts");

    QTest::newRow("program") << ""
                             << QStringList{QStringLiteral("policy check company-phone.json"),
                                            QStringLiteral("3  the service"), QStringLiteral("--version"),
                                            QStringLiteral("mdmctl --json ")};
    QTest::newRow("group") << "calls"
                           << QStringList{QStringLiteral("Replace all rules of a direction"),
                                          QStringLiteral("calls COMMAND --help")};
    QTest::newRow("command") << "calls add"
                             << QStringList{QStringLiteral("mdmctl calls add [OPTIONS] DIR IMSI ACTION"),
                                            QStringLiteral("--timeout SECONDS"), QStringLiteral("Examples:"),
                                            QStringLiteral("JSON"), QStringLiteral("Exit status: 0 done")};
    QTest::newRow("optional") << "update download" << QStringList{QStringLiteral("[OPTIONS] [VERSION]")};
    QTest::newRow("family without directions")
        << "data set"
        << QStringList{QStringLiteral("mdmctl data set [OPTIONS] IMSI=ACTION..."),
                       QStringLiteral("mdmctl data set 244")};
    QTest::newRow("search") << "call-statistics search"
                            << QStringList{QStringLiteral("--from TIME"), QStringLiteral("\"results\"")};
    for (const char *family : {"calls", "sms", "data"}) {
        for (const char *command : {"remove", "clear"}) {
            const QString words = QStringLiteral("%1 %2").arg(QLatin1String(family), QLatin1String(command));
            QTest::newRow(qPrintable(words)) << words << QStringList{QStringLiteral("\"rules\": []}\n")};
        }
    }
    QTest::newRow("switched off") << "location once"
                                  << QStringList{QStringLiteral("mdmctl location settings")};
    QTest::newRow("several") << "calls set" << QStringList{QStringLiteral("DIR IMSI=ACTION...")};
}

void MdmctlUsageTest::helpTeachesAtEachLevel()
{
    QFETCH(QString, command);
    QFETCH(QStringList, parts);
    const QStringList path = command.split(QLatin1Char(' '), Qt::SkipEmptyParts);
    const Mdmctl::Result help = Mdmctl::run(path + QStringList(QStringLiteral("--help")));
    QCOMPARE(help.status, 0);
    QCOMPARE(help.errors, QString());
    for (const QString &part : qAsConst(parts))
        QVERIFY2(help.output.contains(part), qPrintable(help.output));
    const QStringList lines = help.output.split(QLatin1Char('\n'));
    for (const QString &line : lines)
        QVERIFY2(line.size() <= 110, qPrintable(line));
}

void MdmctlUsageTest::tellsItsVersion()
{
    const Mdmctl::Result version = Mdmctl::run({QStringLiteral("--version")});
    QCOMPARE(version.status, 0);
    QVERIFY(QRegularExpression(QStringLiteral("\\Amdmctl [0-9]+\\.[0-9]+\\.[0-9]+\n\\z"))
                .match(version.output)
                .hasMatch());
}

void MdmctlUsageTest::mistakesAreToldInOneLine_data()
{
    QTest::addColumn<QString>("message");

    const auto row = [](const char *arguments, const char *message) {
        QTest::newRow(arguments) << QString::fromUtf8(message);
    };
    row("",
        qPrintable(QStringLiteral("\"mdmctl\" needs a command: must be one of \"%1\"")
                       .arg(families().join(QStringLiteral("\", \"")))));
    row("calls --json",
        R"("mdmctl calls" needs a command: must be one of "show", "add", "remove", "set", "clear", )"
        R"("default", "watch")");
    row("call show", R"(unknown command "call": did you mean "calls"?)");
    row("calls ad dial 1 block", R"(unknown command "ad": did you mean "add"?)");
    row("update upgrade",
        R"(unknown command "upgrade": must be one of "status", "check", "download", "install", "watch")");
    row("--colour", R"(unknown option "--colour": must be one of "--version", "--help")");
    row("--timeout 3 calls show", R"(option "--timeout" goes behind the command it is for)");
    row("--timeout=3 calls show", R"(option "--timeout" goes behind the command it is for)");
    row("calls --timeout 3 show", R"(option "--timeout" goes behind the command it is for)");
    row("--wait update install", R"(option "--wait" goes behind the command it is for)");
    row("calls show --jsno", R"(unknown option "--jsno": did you mean "--json"?)");
    row("update status --timeout 3", R"(unknown option "--timeout": must be one of "--help", "--json")");
    row("calls add", R"(DIR is missing; usage: mdmctl calls add DIR IMSI ACTION)");
    row("calls add dial 1", R"(ACTION is missing; usage: mdmctl calls add DIR IMSI ACTION)");
    row("calls set dial", R"(IMSI=ACTION is missing; usage: mdmctl calls set DIR IMSI=ACTION...)");
    row("calls add dial 1 block x", R"(unexpected argument "x"; usage: mdmctl calls add DIR IMSI ACTION)");
    row("calls add dail 1 block", R"(DIR "dail": did you mean "dial"?)");
    row("calls add dial 24x block", R"(IMSI "24x": must be 1 to 15 decimal digits)");
    row("calls add dial 1234567890123456 block",
        R"(IMSI "1234567890123456": must be 1 to 15 decimal digits)");
    row("calls add dial ٢٤ block", R"(IMSI "٢٤": must be 1 to 15 decimal digits)");
    row("calls remove dial *", R"(IMSI "*": must be 1 to 15 decimal digits)");
    row("calls add dial 1 blok", R"(ACTION "blok": did you mean "block"?)");
    row("calls add dial 1 deny", R"(ACTION "deny": must be one of "block", "allow", "hangup")");
    row("calls add dial 1 hangup",
        R"(ACTION "hangup" is for incoming calls alone: must be one of "block", "allow")");
    row("calls default dial hangup",
        R"(ACTION "hangup" is for incoming calls alone: must be one of "block", "allow")");
    row("calls set dial 1=block 2=hangup",
        R"(ACTION "hangup" is for incoming calls alone: must be one of "block", "allow")");
    row("calls set dial 1:block",
        R"(IMSI=ACTION "1:block": must be an IMSI, "=" and an action, as in 244051234567890=block)");
    row("calls set dial x=block", R"(IMSI=ACTION "x=block": the IMSI must be 1 to 15 decimal digits)");
    row("calls set dial 1=bloc", R"(IMSI=ACTION "1=bloc": unknown action "bloc": did you mean "block"?)");
    row("calls set dial 1=block 2=allow 1=allow", R"(IMSI 1 must be named once)");
    row("calls show --timeout", R"(--timeout needs a value; usage: mdmctl calls show)");
    row("calls show --timeout never",
        R"(--timeout "never": must be a number of seconds greater than 0, at most a week)");
    row("calls show --timeout 0",
        R"(--timeout "0": must be a number of seconds greater than 0, at most a week)");
    row("policy check", R"(FILE is missing; usage: mdmctl policy check FILE)");
    row("policy check /nowhere.json", R"(/nowhere.json: cannot be read: No such file or directory)");
    row("completion zsh", R"(unknown command "zsh": must be "bash")");
}

void MdmctlUsageTest::mistakesAreToldInOneLine()
{
    QFETCH(QString, message);
    const Mdmctl::Result result = Mdmctl::run(words(QTest::currentDataTag()));
    QCOMPARE(result.errors, QStringLiteral("mdmctl: %1\n").arg(message));
    QCOMPARE(result.output, QString());
    QCOMPARE(result.status, 2);
}

void MdmctlUsageTest::bashCompletes_data()
{
    QTest::addColumn<QString>("expected");

    const auto row = [](const char *line, const char *expected) {
        QTest::newRow(line) << QString::fromUtf8(expected);
    };
    // A line that ends with a space has an empty word at the cursor.
    row("mdmctl ", qPrintable(families().join(QLatin1Char(' '))));
    row("mdmctl sim ", "list watch imei imsi iccid numbers");
    row("mdmctl po", "policy");
    row("mdmctl calls ", "show add remove set clear default watch");
    row("mdmctl calls add ", "dial incoming");
    row("mdmctl calls add dial 24405 ", "block allow hangup");
    row("mdmctl calls add --timeout 3 in", "incoming");
    row("mdmctl calls add --timeout ", "");
    row("mdmctl calls add dial --", "--json --timeout --help");
    row("mdmctl sms add 24405 ", "block allow");
    row("mdmctl call-statistics search --", "--first --second --from --to --json --timeout --help");
    row("mdmctl update install --w", "--wait");
    row("mdmctl policy check /etc/host", "/etc/host.conf /etc/hostname /etc/hosts");
    row("mdmctl completion ", "bash");
}

void MdmctlUsageTest::bashCompletes()
{
    QFETCH(QString, expected);
    const QString line = QString::fromUtf8(QTest::currentDataTag());
    const QString script = QStringLiteral("source <('%1' completion bash)\n"
                                          "compopt() { :; }\n"
                                          "COMP_WORDS=(%2 %3)\n"
                                          "COMP_CWORD=$((${#COMP_WORDS[@]} - 1))\n"
                                          "_mdmctl && echo \"${COMPREPLY[*]}\"\n")
                               .arg(QStringLiteral(MDMCTL), line,
                                    line.endsWith(QLatin1Char(' ')) ? QStringLiteral("''") : QString());
    QProcess bash;
    bash.start(QStringLiteral("bash"), {QStringLiteral("-c"), script});
    QVERIFY(bash.waitForFinished());
    QCOMPARE(QString::fromUtf8(bash.readAllStandardError()), QString());
    QStringList candidates
        = QString::fromUtf8(bash.readAllStandardOutput()).simplified().split(QLatin1Char(' '));
    QStringList wanted = expected.split(QLatin1Char(' '));
    if (line.contains(QLatin1Char('/'))) {
        candidates.sort();
        for (const QString &file : qAsConst(wanted))
            QVERIFY2(candidates.contains(file) || !QFile::exists(file), qPrintable(file));
        return;
    }
    QCOMPARE(candidates, wanted);
}

void MdmctlUsageTest::outputThatCannotBeWrittenIsAFailure()
{
    QProcess mdmctl;
    mdmctl.setStandardOutputFile(QStringLiteral("/dev/full"));
    mdmctl.start(QStringLiteral(MDMCTL), {QStringLiteral("policy"), QStringLiteral("schema")});
    QVERIFY(mdmctl.waitForFinished());
    QCOMPARE(QString::fromUtf8(mdmctl.readAllStandardError()),
             QStringLiteral("mdmctl: standard output cannot be written\n"));
    QCOMPARE(mdmctl.exitCode(), 1);
}

QTEST_GUILESS_MAIN(MdmctlUsageTest)
#include "mdmctl_usage_test.moc"
