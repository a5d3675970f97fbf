// SPDX-License-Identifier: LGPL-2.1-or-later
#include "remoteproperties_p.h"

#include "frame/callanswer_p.h"
#include "frame/signalconnection_p.h"

#include <QtCore/QDebug>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMessage>
#include <QtDBus/QDBusPendingReply>
#include <QtDBus/QDBusServiceWatcher>

namespace
{
const QLatin1String propertiesInterface("org.freedesktop.DBus.Properties");
} // namespace

RemoteProperties::RemoteProperties(const QString &service, const QString &path, const QString &interface,
                                   QObject *parent)
    : QObject(parent)
    , m_service(service)
    , m_path(path)
    , m_interface(interface)
{
    const QDBusConnection bus = QDBusConnection::systemBus();
    auto *watcher = new QDBusServiceWatcher(service, bus, QDBusServiceWatcher::WatchForOwnerChange, this);
    connect(watcher, &QDBusServiceWatcher::serviceOwnerChanged, this,
            [this](const QString &, const QString &, const QString &newOwner) {
                m_values.clear();
                m_question.reset();
                if (!newOwner.isEmpty())
                    askForAll();
            });
    // The last signal of the watcher, which a receiver may thus destroy.
    connect(watcher, &QDBusServiceWatcher::serviceUnregistered, this, &RemoteProperties::serviceLeft);
    connectDBusSignal(bus, {service, path, propertiesInterface, QStringLiteral("PropertiesChanged")}, this,
                      SLOT(propertiesChanged(QString, QVariantMap, QStringList)));
    askForAll();
}

void RemoteProperties::askForAll()
{
    QDBusMessage call
        = QDBusMessage::createMethodCall(m_service, m_path, propertiesInterface, QStringLiteral("GetAll"));
    call.setArguments({m_interface});
    m_question = std::make_unique<QObject>();
    CallAnswer::follow(QDBusConnection::systemBus(), call, m_question.get(),
                       [this](const QDBusMessage &answer) { answered(answer); });
}

void RemoteProperties::answered(const QDBusMessage &answer)
{
    m_question.reset();
    const QDBusPendingReply<QVariantMap> reply = answer;
    if (!reply.isError()) {
        m_values = reply.value();
        Q_EMIT changed();
        return;
    }
    // A service that is not there is no failure: it may come.
    const QDBusError::ErrorType error = reply.error().type();
    if (error != QDBusError::ServiceUnknown && error != QDBusError::Disconnected)
        qWarning() << "Cannot read the properties of" << m_interface << reply.error();
}

void RemoteProperties::propertiesChanged(const QString &interface, const QVariantMap &changed,
                                         const QStringList &invalidated)
{
    // What comes before the answer to a question is in the answer.
    if (interface != m_interface || m_question)
        return;
    if (!invalidated.isEmpty()) {
        askForAll();
        return;
    }
    for (auto property = changed.begin(); property != changed.end(); ++property)
        m_values.insert(property.key(), property.value());
    Q_EMIT this->changed();
}
