// SPDX-License-Identifier: LGPL-2.1-or-later
#include "accesspoint.h"

namespace Corvane
{
namespace Agent
{

namespace
{

// By value of the enumerations.
const QStringList &typeNames()
{
    static const QStringList names{QStringLiteral("internet"), QStringLiteral("mms"), QStringLiteral("ims")};
    return names;
}

const QStringList &protocolNames()
{
    static const QStringList names{QStringLiteral("ip"), QStringLiteral("ipv6"), QStringLiteral("dual")};
    return names;
}

const QStringList &authenticationNames()
{
    static const QStringList names{QStringLiteral("none"), QStringLiteral("pap"), QStringLiteral("chap"),
                                   QStringLiteral("any")};
    return names;
}

const QLatin1String nameMember("name");
const QLatin1String apnMember("apn");
const QLatin1String usernameMember("username");
const QLatin1String protocolMember("protocol");
const QLatin1String authenticationMember("authentication");
const QLatin1String messageCenterMember("messageCenter");
const QLatin1String messageProxyMember("messageProxy");

} // namespace

QString accessPointTypeName(AccessPoint::Type type)
{
    return typeNames().value(type);
}

std::optional<AccessPoint::Type> accessPointTypeNamed(const QString &name)
{
    const int type = typeNames().indexOf(name);
    return type < 0 ? std::nullopt : std::make_optional(AccessPoint::Type(type));
}

QStringList accessPointTypeNames()
{
    return typeNames();
}

const QVector<AccessPointMember> &accessPointMembers()
{
    static const QVector<AccessPointMember> members{
        {nameMember, QStringLiteral("Name for people"), {}},
        {apnMember, QStringLiteral("Access point name, as the operator tells it"), {}},
        {usernameMember, QStringLiteral("User name, for authentication"), {}},
        {protocolMember, QStringLiteral("Protocol"), protocolNames()},
        {authenticationMember, QStringLiteral("Authentication method"), authenticationNames()},
        {messageCenterMember, QStringLiteral("Address of the multimedia message centre"), {}},
        {messageProxyMember, QStringLiteral("Proxy for multimedia messages"), {}},
    };
    return members;
}

QJsonObject accessPointToJson(const AccessPoint &accessPoint)
{
    return {
        {nameMember, accessPoint.name},
        {apnMember, accessPoint.accessPointName},
        {usernameMember, accessPoint.username},
        {protocolMember, protocolNames().value(accessPoint.protocol)},
        {authenticationMember, authenticationNames().value(accessPoint.authenticationMethod)},
        {messageCenterMember, accessPoint.messageCenter},
        {messageProxyMember, accessPoint.messageProxy},
    };
}

AccessPoint accessPointWith(AccessPoint accessPoint, const QJsonObject &json)
{
    QJsonObject all = accessPointToJson(accessPoint);
    for (auto member = json.begin(); member != json.end(); ++member)
        all.insert(member.key(), *member);
    accessPoint.name = all.value(nameMember).toString();
    accessPoint.accessPointName = all.value(apnMember).toString();
    accessPoint.username = all.value(usernameMember).toString();
    accessPoint.protocol
        = AccessPoint::Protocol(protocolNames().indexOf(all.value(protocolMember).toString()));
    accessPoint.authenticationMethod = AccessPoint::AuthenticationMethod(
        authenticationNames().indexOf(all.value(authenticationMember).toString()));
    accessPoint.messageCenter = all.value(messageCenterMember).toString();
    accessPoint.messageProxy = all.value(messageProxyMember).toString();
    return accessPoint;
}

} // namespace Agent
} // namespace Corvane
