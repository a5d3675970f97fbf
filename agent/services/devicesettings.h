// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_DEVICESETTINGS_H
#define CORVANE_DEVICESETTINGS_H

#include "reply.h"
#include "service.h"

#include <QtCore/QJsonValue>
#include <QtCore/QObject>
#include <QtCore/QStringList>
#include <QtCore/QVector>

#include <chrono>
#include <functional>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** One setting of the phone, as commands and policies have it. */
struct DeviceSetting {
    enum Kind {
        Switch, ///< true or false; "on" or "off"
        Word, ///< one text
        Words ///< a list of the choices, in their order
    };

    QString name; ///< such as "timeZone"
    QString description;
    Kind kind = Switch;
    QStringList choices; ///< empty: not a choice, or one that only the phone knows
    std::function<QJsonValue()> read;
    std::function<void(const QJsonValue &value)> write;
    /** Why the phone cannot have @p value; empty when it can. */
    std::function<QString(const QJsonValue &value)> obstacle;

    /** @p value for people. */
    static QString textOf(const QJsonValue &value);

    /** What @p text stands for on the command line; undefined: nothing. */
    QJsonValue valueOf(const QString &text) const;

    /** What to write on the command line. */
    QString usage() const;

    /** @p value as read() gives it: a list in the order of the choices, nothing twice. */
    QJsonValue normalised(const QJsonValue &value) const;
};

/** Settings of the phone that belong together. Each change is awaited until the phone confirms it. */
class DeviceSettings : public QObject
{
    Q_OBJECT

public:
    const QVector<DeviceSetting> &all() const { return m_settings; }
    /** The one of that name, or null. */
    const DeviceSetting *find(const QString &name) const;

    /** The service that answers for them. */
    virtual Service service() const = 0;

    /** Waits until they are known; nothing is read or set before. */
    virtual Reply open() = 0;

    /** What is so already is done without asking. */
    Reply set(const DeviceSetting &setting, const QJsonValue &value);

Q_SIGNALS:
    /** One of them is, or may be, another than before. */
    void changed();

protected:
    DeviceSettings(std::chrono::milliseconds timeout, QObject *parent);

    void add(const DeviceSetting &setting) { m_settings.append(setting); }
    std::chrono::milliseconds timeout() const { return m_timeout; }

private:
    std::chrono::milliseconds m_timeout;
    QVector<DeviceSetting> m_settings;
};

using DeviceSettingsMaker = std::function<std::unique_ptr<DeviceSettings>(std::chrono::milliseconds timeout)>;

/** Whether and how the phone finds out where it is. */
std::unique_ptr<DeviceSettings> makeLocationSettings(std::chrono::milliseconds timeout);

/** What clock and time zone follow. */
std::unique_ptr<DeviceSettings> makeClockSettings(std::chrono::milliseconds timeout);

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_DEVICESETTINGS_H
