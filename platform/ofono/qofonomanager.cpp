// SPDX-License-Identifier: LGPL-2.1-or-later
#include <ofono/qofonomanager.h>

#include "ofonoobject_p.h"

#include <QtCore/QVariantMap>
#include <QtDBus/QDBusObjectPath>

namespace
{

const QLatin1String managerInterface("org.ofono.Manager");

} // namespace

class QOfonoManager::Private : public QObject
{
    Q_OBJECT

public:
    explicit Private(QOfonoManager *manager)
        : QObject(manager)
        , q(manager)
        , object(QStringLiteral("/"), managerInterface, this)
    {
        object.follow("ModemAdded", this, SLOT(modemAdded(QDBusObjectPath, QVariantMap)));
        object.follow("ModemRemoved", this, SLOT(modemRemoved(QDBusObjectPath)));
        connect(&object, &OfonoObject::serviceAppeared, this, &Private::askForModems);
        connect(&object, &OfonoObject::serviceLeft, this, [this] {
            modems.clear();
            setAvailable(false);
        });
        object.start();
    }

    QOfonoManager *const q;
    OfonoObject object;
    QStringList modems;
    bool available = false;

private Q_SLOTS:
    void modemAdded(const QDBusObjectPath &path, const QVariantMap &)
    {
        if (modems.contains(path.path()))
            return;
        modems.append(path.path());
        Q_EMIT q->modemAdded(path.path());
    }

    void modemRemoved(const QDBusObjectPath &path)
    {
        modems.removeAll(path.path());
        Q_EMIT q->modemRemoved(path.path());
    }

private:
    void askForModems()
    {
        object.call<QDBusPendingReply<>>(QLatin1String("GetModems"),
                                         [this](const QDBusPendingReply<> &reply) {
                                             const auto listed = listedObjects(reply.reply());
                                             if (!listed)
                                                 return;
                                             modems.clear();
                                             for (const ListedObject &modem : *listed)
                                                 modems.append(modem.path);
                                             setAvailable(true);
                                         });
    }

    void setAvailable(bool isAvailable)
    {
        if (isAvailable == available)
            return;
        available = isAvailable;
        Q_EMIT q->availableChanged(available);
    }
};

QSharedPointer<QOfonoManager> QOfonoManager::instance()
{
    return sharedInThread<QOfonoManager>([] { return new QOfonoManager; });
}

QOfonoManager::QOfonoManager()
    : d(new Private(this))
{
}

QOfonoManager::~QOfonoManager() = default;

bool QOfonoManager::available() const
{
    return d->available;
}

QStringList QOfonoManager::modems() const
{
    return d->modems;
}

#include "qofonomanager.moc"
