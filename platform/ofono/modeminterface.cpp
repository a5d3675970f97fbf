// SPDX-License-Identifier: LGPL-2.1-or-later
#include "modeminterface_p.h"

ModemInterface::ModemInterface(const QString &modemPath, QLatin1String interface, Listing listing,
                               QObject *parent)
    : QObject(parent)
    , m_interface(interface)
    , m_manager(QOfonoManager::instance())
    , m_object(modemPath, interface, this)
    , m_modem(modemPath, QLatin1String("org.ofono.Modem"), this)
    , m_listingTells(listing == AlwaysListed)
{
    m_modem.follow("PropertyChanged", this, SLOT(modemPropertyChanged(QString, QDBusVariant)));
    connect(m_manager.data(), &QOfonoManager::modemAdded, this, [this](const QString &path) {
        if (path == m_object.path() && m_object.isServiceThere())
            Q_EMIT mayHaveCome();
    });
    connect(m_manager.data(), &QOfonoManager::modemRemoved, this, [this](const QString &path) {
        if (path == m_object.path())
            Q_EMIT hasGone();
    });
    connect(&m_object, &OfonoObject::serviceAppeared, this, &ModemInterface::mayHaveCome);
    connect(&m_object, &OfonoObject::serviceLeft, this, &ModemInterface::hasGone);
}

void ModemInterface::start()
{
    // The modem first, so that no change of its interfaces falls between the question and the answer.
    m_modem.start();
    m_object.start();
}

void ModemInterface::modemPropertyChanged(const QString &name, const QDBusVariant &value)
{
    if (name != QLatin1String("Interfaces") || !m_object.isServiceThere())
        return;
    const bool wasListed = m_isListed;
    m_isListed = value.variant().toStringList().contains(m_interface);
    m_listingTells = m_listingTells || m_isListed;
    if (!m_isListed && m_listingTells)
        Q_EMIT hasGone();
    else if (!wasListed)
        Q_EMIT mayHaveCome();
}
