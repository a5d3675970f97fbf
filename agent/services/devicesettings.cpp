// SPDX-License-Identifier: LGPL-2.1-or-later
#include "devicesettings.h"

#include "wait.h"

#include <QtCore/QJsonArray>

#include <algorithm>

namespace Corvane
{
namespace Agent
{

namespace
{

const QLatin1String on("on");
const QLatin1String off("off");
const QLatin1String none("none");

// What the phone's settings library warns of.
const QLatin1String refusals("^(?:Cannot |Unable to enable )");

} // namespace

QString DeviceSetting::textOf(const QJsonValue &value)
{
    if (value.isBool())
        return value.toBool() ? on : off;
    if (!value.isArray())
        return value.toString();
    const QStringList words = value.toVariant().toStringList();
    return words.isEmpty() ? QString(none) : words.join(QLatin1String(", "));
}

QJsonValue DeviceSetting::valueOf(const QString &text) const
{
    if (kind == Switch)
        return text == on ? QJsonValue(true) : text == off ? QJsonValue(false) : QJsonValue::Undefined;
    if (kind == Word)
        return choices.isEmpty() || choices.contains(text) ? QJsonValue(text) : QJsonValue::Undefined;
    const QStringList words = text == none ? QStringList() : text.split(QLatin1Char(','));
    const bool known = std::all_of(words.cbegin(), words.cend(),
                                   [this](const QString &word) { return choices.contains(word); });
    return known ? normalised(QJsonArray::fromStringList(words)) : QJsonValue::Undefined;
}

QString DeviceSetting::usage() const
{
    if (kind == Switch)
        return QStringLiteral("on or off");
    const QString list = choices.join(QLatin1String(", "));
    return kind == Word ? list : QStringLiteral("none, or with commas between them: %1").arg(list);
}

QJsonValue DeviceSetting::normalised(const QJsonValue &value) const
{
    if (kind != Words)
        return value;
    QJsonArray ordered;
    for (const QString &choice : choices) {
        if (value.toArray().contains(choice))
            ordered.append(choice);
    }
    return ordered;
}

DeviceSettings::DeviceSettings(std::chrono::milliseconds timeout, QObject *parent)
    : QObject(parent)
    , m_timeout(timeout)
{
}

const DeviceSetting *DeviceSettings::find(const QString &name) const
{
    const auto found = std::find_if(m_settings.cbegin(), m_settings.cend(),
                                    [&name](const DeviceSetting &setting) { return setting.name == name; });
    return found == m_settings.cend() ? nullptr : &*found;
}

Reply DeviceSettings::set(const DeviceSetting &setting, const QJsonValue &value)
{
    if (setting.read() == value)
        return {};
    const QString obstacle = setting.obstacle ? setting.obstacle(value) : QString();
    if (!obstacle.isEmpty())
        return {Reply::Refused, obstacle};
    Wait wait(service(), m_timeout, QStringLiteral("confirm the change"));
    const WarningCapture capture(refusals, [&](const QString &reason) { wait.end(Reply::Refused, reason); });
    setting.write(value);
    wait.until(this, &DeviceSettings::changed, [&] { return setting.read() == value; });
    return wait.run();
}

} // namespace Agent
} // namespace Corvane
