// SPDX-License-Identifier: LGPL-2.1-or-later
#include <ofono/qofonoextsiminfo.h>

#include "modeminterface_p.h"

#include <QtCore/QPointer>

#include <utility>

namespace
{

const QLatin1String simInfoInterface("org.veldmobile.ofono.SimInfo");

} // namespace

class QOfonoExtSimInfo::Private : public QObject
{
    Q_OBJECT

public:
    struct State {
        bool valid = false;
        QString cardIdentifier;
        QString subscriberIdentity;
        QString serviceProviderName;
    };

    explicit Private(QOfonoExtSimInfo *simInfo)
        : QObject(simInfo)
        , q(simInfo)
    {
    }

    void follow(const QString &path);

    QOfonoExtSimInfo *const q;
    QString modemPath;
    State state;

private Q_SLOTS:
    void cardIdentifierChanged(const QString &value) { set(&State::cardIdentifier, value); }
    void subscriberIdentityChanged(const QString &value) { set(&State::subscriberIdentity, value); }
    void serviceProviderNameChanged(const QString &value) { set(&State::serviceProviderName, value); }

private:
    using Value = QString State::*;

    void askForAll();
    void ask(QLatin1String method, Value value);
    void set(Value value, const QString &text);
    void setState(const State &newState);

    std::unique_ptr<ModemInterface> m_simInfo;
    int m_unanswered = 0;
};

void QOfonoExtSimInfo::Private::follow(const QString &path)
{
    const QPointer<Private> alive(this);
    m_simInfo.reset();
    modemPath = path;
    setState(State());
    if (!alive || path.isEmpty())
        return;
    m_simInfo
        = std::make_unique<ModemInterface>(path, simInfoInterface, ModemInterface::MaybeListed, nullptr);
    m_simInfo->object()->follow("CardIdentifierChanged", this, SLOT(cardIdentifierChanged(QString)));
    m_simInfo->object()->follow("SubscriberIdentityChanged", this, SLOT(subscriberIdentityChanged(QString)));
    m_simInfo->object()->follow("ServiceProviderNameChanged", this,
                                SLOT(serviceProviderNameChanged(QString)));
    connect(m_simInfo.get(), &ModemInterface::mayHaveCome, this, &Private::askForAll);
    connect(m_simInfo.get(), &ModemInterface::hasGone, this, [this] {
        m_simInfo->object()->forgetCalls();
        setState(State());
    });
    m_simInfo->start();
}

void QOfonoExtSimInfo::Private::askForAll()
{
    m_simInfo->object()->forgetCalls();
    m_unanswered = 3;
    ask(QLatin1String("GetCardIdentifier"), &State::cardIdentifier);
    ask(QLatin1String("GetSubscriberIdentity"), &State::subscriberIdentity);
    ask(QLatin1String("GetServiceProviderName"), &State::serviceProviderName);
}

void QOfonoExtSimInfo::Private::ask(QLatin1String method, Value value)
{
    using Reply = QDBusPendingReply<QString>;
    m_simInfo->object()->call<Reply>(method, [this, value](const Reply &reply) {
        if (reply.isError()) {
            setState(State());
            return;
        }
        State known = state;
        known.*value = reply.value();
        known.valid = --m_unanswered == 0 || known.valid;
        setState(known);
    });
}

void QOfonoExtSimInfo::Private::set(Value value, const QString &text)
{
    State changed = state;
    changed.*value = text;
    setState(changed);
}

void QOfonoExtSimInfo::Private::setState(const State &newState)
{
    const State now = newState;
    const State before = std::exchange(state, now);
    // A receiver may delete the sender.
    const QPointer<QOfonoExtSimInfo> alive(q);
    if (now.cardIdentifier != before.cardIdentifier)
        Q_EMIT q->cardIdentifierChanged(now.cardIdentifier);
    if (alive && now.subscriberIdentity != before.subscriberIdentity)
        Q_EMIT q->subscriberIdentityChanged(now.subscriberIdentity);
    if (alive && now.serviceProviderName != before.serviceProviderName)
        Q_EMIT q->serviceProviderNameChanged(now.serviceProviderName);
    if (alive && now.valid != before.valid)
        Q_EMIT q->validChanged(now.valid);
}

QOfonoExtSimInfo::QOfonoExtSimInfo(QObject *parent)
    : QObject(parent)
    , d(new Private(this))
{
}

QOfonoExtSimInfo::~QOfonoExtSimInfo() = default;

QString QOfonoExtSimInfo::modemPath() const
{
    return d->modemPath;
}

void QOfonoExtSimInfo::setModemPath(const QString &path)
{
    if (path != d->modemPath)
        d->follow(path);
}

bool QOfonoExtSimInfo::isValid() const
{
    return d->state.valid;
}

QString QOfonoExtSimInfo::cardIdentifier() const
{
    return d->state.cardIdentifier;
}

QString QOfonoExtSimInfo::subscriberIdentity() const
{
    return d->state.subscriberIdentity;
}

QString QOfonoExtSimInfo::serviceProviderName() const
{
    return d->state.serviceProviderName;
}

#include "qofonoextsiminfo.moc"
