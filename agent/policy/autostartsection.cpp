// SPDX-License-Identifier: LGPL-2.1-or-later
#include "autostartsection.h"

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

QString AutostartSection::member() const
{
    return QStringLiteral("autostart");
}

Service AutostartSection::service() const
{
    return Service::mdmProxy();
}

Reply AutostartSection::open(const QJsonObject &)
{
    m_applications = std::make_unique<SessionApplications>();
    return {};
}

void AutostartSection::close()
{
    m_applications.reset();
}

QString AutostartSection::nameOf(const QJsonValue &entry) const
{
    return entry.toString();
}

Reply AutostartSection::look()
{
    return m_applications->list(m_desktopFiles);
}

QString AutostartSection::presentEntry(const QJsonValue &entry) const
{
    // A bare file name means the entry wherever the phone has it.
    const QString name = entry.toString();
    const auto found = std::find_if(m_desktopFiles.cbegin(), m_desktopFiles.cend(), [&](const QString &each) {
        return each == name || each.endsWith(QLatin1Char('/') + name);
    });
    return found == m_desktopFiles.cend() ? QString() : *found;
}

bool AutostartSection::has(const QJsonValue &entry) const
{
    return !presentEntry(entry).isEmpty();
}

Reply AutostartSection::add(const QJsonValue &entry)
{
    return m_applications->add(entry.toString());
}

Reply AutostartSection::remove(const QJsonValue &entry)
{
    return m_applications->remove(presentEntry(entry));
}

QJsonObject AutostartSection::exported()
{
    if (!look().isDone())
        return {};
    return {{QStringLiteral("required"), QJsonArray::fromStringList(m_desktopFiles)}};
}

} // namespace Agent
} // namespace Corvane
