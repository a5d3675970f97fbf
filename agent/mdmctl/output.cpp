// SPDX-License-Identifier: LGPL-2.1-or-later
#include "output.h"

#include <QtCore/QDateTime>
#include <QtCore/QJsonDocument>

#include <cstdio>

namespace Corvane
{
namespace Agent
{

namespace
{

void write(std::FILE *stream, const QByteArray &text)
{
    std::fwrite(text.constData(), 1, std::size_t(text.size()), stream);
}

} // namespace

void print(const QString &line)
{
    write(stdout, line.toUtf8() + '\n');
}

void print(const QJsonObject &object)
{
    write(stdout, QJsonDocument(object).toJson(QJsonDocument::Indented));
}

void EventLog::write(const QString &text, const QJsonObject &members) const
{
    const QString time = QDateTime::currentDateTimeUtc().toString(Qt::ISODateWithMs);
    if (m_json) {
        QJsonObject event = members;
        event.insert(QStringLiteral("time"), time);
        print(QString::fromUtf8(QJsonDocument(event).toJson(QJsonDocument::Compact)));
    } else {
        print(time + QLatin1String("  ") + text);
    }
    flushOutput();
}

void printError(const QString &text)
{
    flushOutput();
    write(stderr, "mdmctl: " + text.toUtf8() + '\n');
}

bool flushOutput()
{
    return std::fflush(stdout) == 0 && !std::ferror(stdout);
}

} // namespace Agent
} // namespace Corvane
