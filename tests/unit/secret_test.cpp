// SPDX-License-Identifier: LGPL-2.1-or-later
#include <secret.h>

#include <QtCore/QTemporaryDir>
#include <QtTest/QtTest>

using namespace Corvane::Agent;

class SecretTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void lineOfAFile_data();
    void lineOfAFile();
    void unusableFile_data();
    void unusableFile();
    void fileThatCannotBeRead();
    void environment();

private:
    QString fileWith(const QByteArray &content);

    QTemporaryDir m_folder;
};

QString SecretTest::fileWith(const QByteArray &content)
{
    QFile file(m_folder.filePath(QStringLiteral("secret")));
    if (!file.open(QIODevice::WriteOnly | QIODevice::Truncate) || file.write(content) != content.size())
        qFatal("cannot write %s", qPrintable(file.fileName()));
    return file.fileName();
}

void SecretTest::lineOfAFile_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("text");

    QTest::newRow("without an end") << QByteArray("s3cret") << QStringLiteral("s3cret");
    QTest::newRow("with an end") << QByteArray("s3cret\n") << QStringLiteral("s3cret");
    QTest::newRow("written on another system") << QByteArray("s3cret\r\n") << QStringLiteral("s3cret");
    QTest::newRow("spaces belong to it") << QByteArray(" s3 cret \n") << QStringLiteral(" s3 cret ");
    QTest::newRow("not of ASCII") << QByteArray("n\xc3\xb6\xe2\x82\xac\n") << QString::fromUtf8("nö€");
    QTest::newRow("longest") << QByteArray(4096, 'x') << QString(4096, QLatin1Char('x'));
}

void SecretTest::lineOfAFile()
{
    QFETCH(QByteArray, content);
    const Secret secret = secretFromFile(fileWith(content));
    QVERIFY2(secret.reply.isDone(), qPrintable(secret.reply.text));
    QTEST(secret.text, "text");
}

void SecretTest::unusableFile_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QString>("why");

    QTest::newRow("empty") << QByteArray() << QStringLiteral("holds no secret");
    QTest::newRow("empty line") << QByteArray("\n") << QStringLiteral("holds no secret");
    QTest::newRow("two lines") << QByteArray("user\ns3cret\n") << QStringLiteral("must hold one line");
    QTest::newRow("empty line behind it") << QByteArray("s3cret\n\n") << QStringLiteral("must hold one line");
    QTest::newRow("no text") << QByteArray("s3\xff") << QStringLiteral("must hold text in UTF-8");
    QTest::newRow("null character") << QByteArray("s3\0cret", 7) << QStringLiteral("must hold text in UTF-8");
    QTest::newRow("too long") << QByteArray(4097, 'x')
                              << QStringLiteral("is too large, must be at most 4096 bytes");
}

void SecretTest::unusableFile()
{
    QFETCH(QByteArray, content);
    QFETCH(QString, why);
    const QString file = fileWith(content);
    const Secret secret = secretFromFile(file);
    QCOMPARE(secret.reply.outcome, Reply::Refused);
    QCOMPARE(secret.reply.text, QStringLiteral("%1 %2").arg(file, why));
    QCOMPARE(secret.text, QString());
}

void SecretTest::fileThatCannotBeRead()
{
    for (const QString &file : {m_folder.filePath(QStringLiteral("none")), m_folder.path()}) {
        const Secret secret = secretFromFile(file);
        QCOMPARE(secret.reply.outcome, Reply::Refused);
        QVERIFY2(secret.reply.text.startsWith(file + QLatin1String(" cannot be read: ")),
                 qPrintable(secret.reply.text));
    }
}

void SecretTest::environment()
{
    qputenv("CORVANE_TEST_SECRET", "s3cret");
    QCOMPARE(secretFromEnvironment(QStringLiteral("CORVANE_TEST_SECRET")).text, QStringLiteral("s3cret"));
    qunsetenv("CORVANE_TEST_SECRET");
    const Secret missing = secretFromEnvironment(QStringLiteral("CORVANE_TEST_SECRET"));
    QCOMPARE(missing.reply.outcome, Reply::Refused);
    QCOMPARE(missing.reply.text, QStringLiteral("the environment variable CORVANE_TEST_SECRET is not set"));
}

QTEST_APPLESS_MAIN(SecretTest)
#include "secret_test.moc"
