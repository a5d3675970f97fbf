// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANEMDM_ASYNCCOMMAND_P_H
#define CORVANEMDM_ASYNCCOMMAND_P_H

#include "platform/frame/callanswer_p.h"

#include <QtCore/QPointer>
#include <QtDBus/QDBusAbstractInterface>
#include <QtDBus/QDBusPendingCall>

#include <utility>

namespace Corvane
{
namespace Mdm
{

/** Hands the answer of @p call to @p slot of @p owner, which must delete the watcher later; dies with @p
 * owner, or with @p parent when there is one. */
template <typename Owner>
void watchCall(const QDBusPendingCall &call, Owner *owner, void (Owner::*slot)(QDBusPendingCallWatcher *),
               QObject *parent = nullptr)
{
    auto *watcher = new QDBusPendingCallWatcher(call, parent ? parent : owner);
    QObject::connect(watcher, &QDBusPendingCallWatcher::finished, owner, slot);
}

/**
 * Calls @p method of @p interface, for the state that @p owner mirrors: the answer comes at its place among
 * the signals of the service, see CallAnswer. The rest is as with watchCall().
 */
template <typename Owner>
void askForState(QDBusAbstractInterface *interface, const QString &method, Owner *owner,
                 void (Owner::*slot)(QDBusPendingCallWatcher *), QObject *parent = nullptr)
{
    QObject *context = parent ? parent : owner;
    CallAnswer::follow(
        interface->connection(),
        QDBusMessage::createMethodCall(interface->service(), interface->path(), interface->interface(),
                                       method),
        context,
        [owner, slot, context](const QDBusMessage &answer) {
            (owner->*slot)(new QDBusPendingCallWatcher(QDBusPendingCall::fromCompletedCall(answer), context));
        },
        interface->timeout());
}

/** Calls back once @p call has been answered; how AsyncCommand learns the outcome of its pending object. */
template <typename Success, typename Failure>
void connectOutcome(QDBusPendingCallWatcher *call, QObject *context, Success success, Failure failure)
{
    QObject::connect(call, &QDBusPendingCallWatcher::finished, context,
                     [success, failure](QDBusPendingCallWatcher *watcher) {
                         watcher->deleteLater();
                         if (watcher->isError())
                             failure();
                         else
                             success();
                     });
}

/**
 * A command of @p Feature with a busy flag: at most one is pending, and a newer one supersedes it.
 *
 * The busy signal comes right after the command was sent, and again before the signal that tells how it
 * ended. The outcome of a superseded command is not reported. @p Pending is the object that stands for the
 * pending answer; an overload of connectOutcome() must exist for it.
 */
template <typename Feature, typename Pending = QDBusPendingCallWatcher> class AsyncCommand
{
public:
    using Signal = void (Feature::*)();

    AsyncCommand(Feature *feature, Signal busyChanged, Signal succeeded, Signal failed)
        : m_feature(feature)
        , m_busyChanged(busyChanged)
        , m_succeeded(succeeded)
        , m_failed(failed)
    {
    }

    ~AsyncCommand() { drop(); }

    bool isBusy() const { return m_pending || m_refusal; }

    /** Takes over @p pending, the answer to a command that has just been sent. */
    void follow(Pending *pending)
    {
        drop();
        m_pending = pending;
        connectOutcome(
            pending, m_feature, [this] { finish(m_succeeded); }, [this] { finish(m_failed); });
        Q_EMIT(m_feature->*m_busyChanged)();
    }

    /** Stands in for follow() when the command cannot be sent: it fails from the event loop, as any other. */
    void refuse()
    {
        drop();
        m_refusal = new QObject;
        QMetaObject::invokeMethod(
            m_refusal, [this] { finish(m_failed); }, Qt::QueuedConnection);
        Q_EMIT(m_feature->*m_busyChanged)();
    }

private:
    Q_DISABLE_COPY(AsyncCommand)

    void drop()
    {
        delete std::exchange(m_pending, nullptr);
        delete std::exchange(m_refusal, nullptr);
    }

    void finish(Signal outcome)
    {
        m_pending = nullptr;
        if (m_refusal)
            std::exchange(m_refusal, nullptr)->deleteLater(); // it is calling
        // A receiver of the first signal may delete the feature, and this command with it.
        const QPointer<Feature> feature(m_feature);
        Q_EMIT(m_feature->*m_busyChanged)();
        if (feature)
            Q_EMIT(feature->*outcome)();
    }

    Feature *const m_feature;
    const Signal m_busyChanged;
    const Signal m_succeeded;
    const Signal m_failed;
    Pending *m_pending = nullptr;
    QObject *m_refusal = nullptr;
};

} // namespace Mdm
} // namespace Corvane

#endif // CORVANEMDM_ASYNCCOMMAND_P_H
