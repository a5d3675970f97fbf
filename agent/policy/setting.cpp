// SPDX-License-Identifier: LGPL-2.1-or-later
#include "setting.h"

namespace Corvane
{
namespace Agent
{

Setting::Value Setting::Value::onOff(bool on)
{
    return {on, on ? QStringLiteral("on") : QStringLiteral("off")};
}

QString Setting::statusName() const
{
    switch (status) {
    case Compliant:
        return QStringLiteral("compliant");
    case Different:
        return QStringLiteral("different");
    case Changed:
        return QStringLiteral("changed");
    case Failed:
        return QStringLiteral("failed");
    case Unsupported:
        return QStringLiteral("unsupported");
    }
    return QString();
}

QJsonObject Setting::toJson() const
{
    return {
        {QStringLiteral("path"), path},
        {QStringLiteral("status"), statusName()},
        {QStringLiteral("present"), present.json},
        {QStringLiteral("wanted"), wanted.json},
        {QStringLiteral("detail"), detail},
    };
}

Setting Setting::with(Status newStatus, const QString &newDetail) const
{
    Setting setting = *this;
    setting.status = newStatus;
    setting.detail = newDetail;
    return setting;
}

Setting Setting::compared() const
{
    Setting setting = *this;
    setting.status = present.json == wanted.json ? Compliant : Different;
    return setting;
}

Setting Setting::unanswered(const Reply &reply, Status whenMissing) const
{
    Setting setting = with(Failed, reply.text);
    if (reply.outcome == Reply::ServiceLost) {
        setting.serviceMissing = true;
        setting.status = whenMissing;
    }
    return setting;
}

} // namespace Agent
} // namespace Corvane
