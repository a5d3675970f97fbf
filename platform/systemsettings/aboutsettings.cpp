// SPDX-License-Identifier: LGPL-2.1-or-later
#include <systemsettings/aboutsettings.h>

#include <QtCore/QDir>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>

namespace
{

const QLatin1String networkFolder("/sys/class/net");

/** The value as a shell would assign it. */
QString unquoted(const QString &text)
{
    QString value;
    QChar quote;
    for (auto each = text.begin(); each != text.end(); ++each) {
        const bool isQuote = *each == QLatin1Char('"') || *each == QLatin1Char('\'');
        if (isQuote && quote.isNull())
            quote = *each;
        else if (*each == quote && !quote.isNull())
            quote = QChar();
        else if (*each == QLatin1Char('\\') && quote != QLatin1Char('\'') && each + 1 != text.end())
            value += *++each;
        else if (quote.isNull() && each->isSpace())
            break;
        else
            value += *each;
    }
    return value;
}

QString osRelease(QLatin1String key)
{
    // The second is what the first usually leads to, and counts when that is missing.
    for (const char *name : {"/etc/os-release", "/usr/lib/os-release"}) {
        QFile file{QLatin1String(name)};
        if (!file.open(QIODevice::ReadOnly))
            continue;
        QString value;
        while (!file.atEnd()) {
            const QString line = QString::fromUtf8(file.readLine()).trimmed();
            // As in a shell, the last assignment counts.
            if (line.startsWith(key) && line.midRef(key.size()).startsWith(QLatin1Char('=')))
                value = unquoted(line.mid(key.size() + 1));
        }
        return value;
    }
    return QString();
}

bool isWireless(const QString &interface)
{
    return QFileInfo::exists(interface + QLatin1String("/phy80211"))
        || QFileInfo::exists(interface + QLatin1String("/wireless"));
}

} // namespace

AboutSettings::AboutSettings(QObject *parent)
    : QObject(parent)
{
}

AboutSettings::~AboutSettings() = default;

QString AboutSettings::softwareVersion() const
{
    return osRelease(QLatin1String("VERSION"));
}

QString AboutSettings::softwareVersionId() const
{
    return osRelease(QLatin1String("VERSION_ID"));
}

QString AboutSettings::wlanMacAddress() const
{
    const QStringList names = QDir(networkFolder).entryList(QDir::Dirs | QDir::NoDotAndDotDot, QDir::Name);
    for (const QString &name : names) {
        const QString interface = networkFolder + QLatin1Char('/') + name;
        QFile address(interface + QLatin1String("/address"));
        if (isWireless(interface) && address.open(QIODevice::ReadOnly))
            return QString::fromLatin1(address.readLine()).trimmed();
    }
    return QString();
}
