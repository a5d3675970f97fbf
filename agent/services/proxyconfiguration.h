// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_PROXYCONFIGURATION_H
#define CORVANE_PROXYCONFIGURATION_H

#include <corvanemdm/netproxy.h>

#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Agent
{

/** How traffic finds its proxy, as commands and policies write it. */
struct ProxyConfiguration {
    Mdm::NetProxy::ProxyType type = Mdm::NetProxy::Direct;
    QStringList servers; ///< of the type Manual, as are the exclusions
    QStringList exclusions;
    QString url; ///< of the type Automatic

    /** Of an object that the policy's schema has accepted. */
    static ProxyConfiguration fromJson(const QJsonObject &object);
    /** With what the type uses. */
    QJsonObject toJson() const;
    /** "direct", "manual: http://proxy:3128, but not localhost" */
    QString toString() const;

    /** What is wrong with @p url as that of a server or a script, and what would be right; empty when nothing
     * is. */
    static QString urlFault(const QString &url);

    /** Whether traffic finds the same way. */
    bool operator==(const ProxyConfiguration &other) const { return toJson() == other.toJson(); }
    bool operator!=(const ProxyConfiguration &other) const { return !(*this == other); }
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_PROXYCONFIGURATION_H
