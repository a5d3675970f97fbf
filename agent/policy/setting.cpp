// SPDX-License-Identifier: LGPL-2.1-or-later
#include "setting.h"

namespace Corvane
{
namespace Agent
{

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

} // namespace Agent
} // namespace Corvane
