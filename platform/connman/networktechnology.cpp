// SPDX-License-Identifier: LGPL-2.1-or-later
#include "networktechnology_p.h"

#include "networkmanager_p.h"

#include <QtDBus/QDBusVariant>

namespace
{

const QLatin1String nameProperty("Name");
const QLatin1String typeProperty("Type");
const QLatin1String poweredProperty("Powered");

} // namespace

NetworkTechnology::Private::Changes NetworkTechnology::Private::set(const QVariantMap &properties)
{
    const bool wasPowered = powered;
    name = properties.value(nameProperty, name).toString();
    type = properties.value(typeProperty, type).toString();
    powered = properties.value(poweredProperty, powered).toBool();
    return powered == wasPowered ? Changes() : Changes(Powered);
}

void NetworkTechnology::Private::signal(Changes changes)
{
    if (changes.testFlag(Powered))
        Q_EMIT q->poweredChanged(powered);
}

NetworkTechnology::NetworkTechnology(const QString &path, QObject *parent)
    : QObject(parent)
    , d(new Private(this, path))
{
}

NetworkTechnology::~NetworkTechnology()
{
    delete d;
}

QString NetworkTechnology::path() const
{
    return d->path;
}

QString NetworkTechnology::name() const
{
    return d->name;
}

QString NetworkTechnology::type() const
{
    return d->type;
}

bool NetworkTechnology::powered() const
{
    return d->powered;
}

void NetworkTechnology::setPowered(bool powered)
{
    if (d->manager) {
        d->manager->d->requestOfTechnology(
            d->path, QLatin1String("SetProperty"),
            {QString(poweredProperty), QVariant::fromValue(QDBusVariant(powered))});
    }
}
