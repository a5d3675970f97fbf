// SPDX-License-Identifier: LGPL-2.1-or-later
// Whether the partition of the user's data is encrypted: images that the real cryptsetup makes, and what is
// none.
#include "messagelog.h"

#include <corvanemdm/devicelock.h>

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QLoggingCategory>
#include <QtCore/QProcess>
#include <QtCore/QTemporaryFile>
#include <QtTest/QtTest>

#include <sys/stat.h>
#include <unistd.h>

using Corvane::Mdm::DeviceLock;

namespace
{

const QString HomeDevice = QStringLiteral("/dev/corvane/home");
const QString DebugRule = QStringLiteral("org.corvaneos.device.encryption.debug=true");

bool writeHome(const QByteArray &content)
{
    QFile file(HomeDevice);
    return file.open(QIODevice::WriteOnly) && file.write(content) == content.size();
}

bool encryptHome(const QStringList &options)
{
    if (!writeHome(QByteArray(1 << 20, '\0')))
        return false;
    QProcess cryptsetup;
    cryptsetup.setProcessChannelMode(QProcess::ForwardedErrorChannel);
    cryptsetup.start(QStringLiteral("/usr/sbin/cryptsetup"),
                     QStringList{QStringLiteral("luksFormat"), QStringLiteral("--batch-mode"),
                                 QStringLiteral("--pbkdf-force-iterations"), QStringLiteral("1000"),
                                 QStringLiteral("--cipher"), QStringLiteral("aes-cbc-essiv:sha256"),
                                 QStringLiteral("--key-size"), QStringLiteral("128"),
                                 QStringLiteral("--key-file"), QStringLiteral("-"), HomeDevice}
                         + options);
    cryptsetup.write("secret");
    cryptsetup.closeWriteChannel();
    return cryptsetup.waitForFinished(60000) && cryptsetup.exitCode() == 0;
}

/** What the process writes to one of its standard streams while this lives. */
class StreamCapture
{
public:
    explicit StreamCapture(int stream)
        : m_stream(stream)
        , m_previous(dup(stream))
    {
        fflush(nullptr);
        if (!m_file.open() || dup2(m_file.handle(), stream) < 0)
            qFatal("cannot capture a stream");
    }
    ~StreamCapture() { end(); }
    Q_DISABLE_COPY(StreamCapture)

    QByteArray end()
    {
        if (m_previous < 0)
            return QByteArray();
        fflush(nullptr);
        dup2(m_previous, m_stream);
        close(m_previous);
        m_previous = -1;
        m_file.seek(0);
        return m_file.readAll();
    }

private:
    const int m_stream;
    int m_previous;
    QTemporaryFile m_file;
};

} // namespace

class DeviceLockEncryptionTest : public QObject
{
    Q_OBJECT

private Q_SLOTS:
    void init();
    void cleanup();

    void phoneIsEncrypted();
    void imagesOfCryptsetup_data();
    void imagesOfCryptsetup();
    void whatIsNoEncryptedPartition_data();
    void whatIsNoEncryptedPartition();
    void everyReadLooksAnew();
    void categoryIsSilentBelowWarnings();
    void libraryItselfSpeaksToTheCategory();

private:
    QByteArray m_image;
};

void DeviceLockEncryptionTest::init()
{
    QFile file(HomeDevice);
    if (m_image.isEmpty() && file.open(QIODevice::ReadOnly))
        m_image = file.readAll();
}

void DeviceLockEncryptionTest::cleanup()
{
    QLoggingCategory::setFilterRules(QString());
    QDir(HomeDevice).removeRecursively();
    QFile::remove(HomeDevice);
    QVERIFY(writeHome(m_image));
}

void DeviceLockEncryptionTest::phoneIsEncrypted()
{
    const DeviceLock lock;
    QVERIFY(lock.isHomeEncrypted());
    QCOMPARE(lock.property("homeEncrypted"), QVariant(true));
}

void DeviceLockEncryptionTest::imagesOfCryptsetup_data()
{
    QTest::addColumn<QStringList>("options");
    QTest::newRow("LUKS 1") << QStringList{QStringLiteral("--type"), QStringLiteral("luks1"),
                                           QStringLiteral("--align-payload"), QStringLiteral("1")};
    QTest::newRow("LUKS 2") << QStringList{QStringLiteral("--type"),
                                           QStringLiteral("luks2"),
                                           QStringLiteral("--pbkdf"),
                                           QStringLiteral("pbkdf2"),
                                           QStringLiteral("--luks2-metadata-size"),
                                           QStringLiteral("16k"),
                                           QStringLiteral("--luks2-keyslots-size"),
                                           QStringLiteral("128k")};
}

void DeviceLockEncryptionTest::imagesOfCryptsetup()
{
    QFETCH(QStringList, options);
    QVERIFY(encryptHome(options));
    const DeviceLock lock;
    QVERIFY(lock.isHomeEncrypted());
    // Both copies of the header gone: what is left is noise.
    QFile file(HomeDevice);
    QVERIFY(file.open(QIODevice::ReadWrite));
    file.write(QByteArray(64 << 10, '\0'));
    file.close();
    QVERIFY(!lock.isHomeEncrypted());
}

void DeviceLockEncryptionTest::whatIsNoEncryptedPartition_data()
{
    QTest::addColumn<QByteArray>("content");
    QTest::addColumn<QByteArray>("message");
    const QByteArray notInitialised("Could not initialize crypt_device");
    const QByteArray notLoaded("Could not load LUKS parameters for crypt_device");
    QTest::newRow("none") << QByteArray() << notInitialised;
    QTest::newRow("folder") << QByteArray("folder") << notInitialised;
    QTest::newRow("plain") << QByteArray(1 << 20, '\0') << notLoaded;
    QTest::newRow("short") << QByteArray("LUKS\xba\xbe") << notLoaded;
    QTest::newRow("magic alone") << QByteArray("LUKS\xba\xbe").append(QByteArray(1 << 20, '\0')) << notLoaded;
    QTest::newRow("unknown version") << QByteArray("LUKS\xba\xbe\x00\x09", 8).append(QByteArray(1 << 20, 'x'))
                                     << notLoaded;
}

void DeviceLockEncryptionTest::whatIsNoEncryptedPartition()
{
    QFETCH(QByteArray, content);
    QFETCH(QByteArray, message);
    QVERIFY(QFile::remove(HomeDevice));
    if (content == "folder")
        QVERIFY(QDir().mkpath(HomeDevice));
    else if (!content.isEmpty())
        QVERIFY(writeHome(content));
    const DeviceLock lock;

    // By default nothing is written, by whatever way.
    StreamCapture output(STDOUT_FILENO);
    StreamCapture error(STDERR_FILENO);
    const bool isEncrypted = lock.isHomeEncrypted();
    const bool isEncryptedAsProperty = lock.property("homeEncrypted").toBool();
    const QByteArray errorText = error.end();
    const QByteArray outputText = output.end();
    QVERIFY(!isEncrypted && !isEncryptedAsProperty);
    QCOMPARE(outputText, QByteArray());
    QCOMPARE(errorText, QByteArray());

    QLoggingCategory::setFilterRules(DebugRule);
    QTest::ignoreMessage(QtDebugMsg, message.constData());
    QVERIFY(!lock.isHomeEncrypted());
}

void DeviceLockEncryptionTest::everyReadLooksAnew()
{
    const DeviceLock lock;
    QVERIFY(lock.isHomeEncrypted());
    QVERIFY(QFile::remove(HomeDevice));
    QVERIFY(!lock.isHomeEncrypted());
    QVERIFY(writeHome(m_image));
    QVERIFY(lock.isHomeEncrypted());
}

void DeviceLockEncryptionTest::categoryIsSilentBelowWarnings()
{
    // The same category by its name: a rule of the user's reaches the library.
    QVERIFY(QFile::remove(HomeDevice));
    const DeviceLock lock;
    QLoggingCategory::setFilterRules(QStringLiteral("org.corvaneos.device.encryption.info=true"));
    StreamCapture error(STDERR_FILENO);
    lock.isHomeEncrypted();
    QCOMPARE(error.end(), QByteArray());
}

void DeviceLockEncryptionTest::libraryItselfSpeaksToTheCategory()
{
    QVERIFY(QFile::remove(HomeDevice));
    const DeviceLock lock;
    QLoggingCategory::setFilterRules(DebugRule);
    // Its text is its own, but names the device.
    QTest::ignoreMessage(QtDebugMsg, QRegularExpression(QStringLiteral("/dev/corvane/home")));
    QTest::ignoreMessage(QtDebugMsg, "Could not initialize crypt_device");
    StreamCapture output(STDOUT_FILENO);
    StreamCapture error(STDERR_FILENO);
    lock.isHomeEncrypted();
    const QByteArray errorText = error.end();
    const QByteArray outputText = output.end();
    QCOMPARE(outputText + errorText, QByteArray());
}

QTEST_GUILESS_MAIN(DeviceLockEncryptionTest)
#include "devicelock_encryption_test.moc"
