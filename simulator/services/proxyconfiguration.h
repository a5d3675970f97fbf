// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_PROXYCONFIGURATION_H
#define CORVANE_SIMULATOR_PROXYCONFIGURATION_H

#include "glibpointers.h"

#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

namespace Corvane
{
namespace Simulator
{

/** How traffic finds its proxy, as the connection manager keeps it. */
class ProxyConfiguration
{
public:
    /** One that was never made: it has no method. */
    ProxyConfiguration() = default;
    /** From the profile; what it leaves out is empty. */
    explicit ProxyConfiguration(const QJsonObject &object);
    /** From the words of an action: direct, auto [URL], manual SERVERS [EXCLUDES]; throws Refusal. */
    explicit ProxyConfiguration(const QStringList &words);
    /** From "a{sv}"; throws MethodError. */
    explicit ProxyConfiguration(const Variant &dictionary);

    /** "a{sv}", with what the method uses. */
    Variant toVariant() const;
    QJsonObject toJson() const;

    /** The usage of the words of an action. */
    static QString usage();

private:
    QString m_method;
    QStringList m_servers;
    QStringList m_excludes;
    QString m_url;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_PROXYCONFIGURATION_H
