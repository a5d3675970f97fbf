// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_PLATFORM_FRAME_SIGNALCONNECTION_P_H
#define CORVANEMDM_PLATFORM_FRAME_SIGNALCONNECTION_P_H

#include <QtCore/QMetaMethod>
#include <QtCore/QObject>
#include <QtDBus/QDBusConnection>
#include <QtDBus/QDBusMetaType>

/** A signal that is emitted over D-Bus. */
struct DBusSignal {
    QString service; ///< empty on a connection to a peer
    QString path;
    QString interface;
    QString member;
};

/**
 * The wire signature of what @p slot of @p receiver takes, a SLOT() or SIGNAL(). Null without arguments, or
 * when it takes the message: such a slot reads nothing that could be of another type.
 */
inline QString signatureOfSlot(const QObject *receiver, const char *slot)
{
    const QMetaObject *metaObject = receiver->metaObject();
    // What SLOT() and SIGNAL() put in front is one character.
    const QMetaMethod method
        = metaObject->method(metaObject->indexOfMethod(QMetaObject::normalizedSignature(slot + 1)));
    QString signature;
    for (int index = 0; index < method.parameterCount(); ++index)
        signature += QLatin1String(QDBusMetaType::typeToSignature(method.parameterType(index)));
    return signature;
}

/**
 * Connects @p signal to @p slot, for messages of the slot's signature alone.
 *
 * QtDBus itself lets any array, structure or map through to a slot and ends the program when it cannot be
 * read as the slot's type: a service could end its clients with one signal.
 */
inline bool connectDBusSignal(QDBusConnection bus, const DBusSignal &signal, QObject *receiver,
                              const char *slot)
{
    return bus.connect(signal.service, signal.path, signal.interface, signal.member, QStringList(),
                       signatureOfSlot(receiver, slot), receiver, slot);
}

/** Ends what connectDBusSignal() with the same arguments began. */
inline bool disconnectDBusSignal(QDBusConnection bus, const DBusSignal &signal, QObject *receiver,
                                 const char *slot)
{
    return bus.disconnect(signal.service, signal.path, signal.interface, signal.member, QStringList(),
                          signatureOfSlot(receiver, slot), receiver, slot);
}

#endif // CORVANEMDM_PLATFORM_FRAME_SIGNALCONNECTION_P_H
