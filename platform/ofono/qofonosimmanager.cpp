// SPDX-License-Identifier: LGPL-2.1-or-later
#include <ofono/qofonosimmanager.h>

#include "modeminterface_p.h"

#include <QtCore/QPointer>
#include <QtCore/QVariantMap>

#include <algorithm>
#include <utility>

namespace
{

const QLatin1String simInterface("org.ofono.SimManager");

/** The service's words, each at the place of its number. */
const char *const pinWords[]
    = {"none", "pin", "pin2", "phone",         "firstphone", "network",   "netsub",     "service",
       "corp", "puk", "puk2", "firstphonepuk", "networkpuk", "netsubpuk", "servicepuk", "corppuk"};
static_assert(std::size(pinWords) == QOfonoSimManager::CorporatePersonalizationPuk + 1, "one word a PIN");

QOfonoSimManager::PinType pinOf(const QString &word)
{
    const auto *known = std::find_if(std::begin(pinWords), std::end(pinWords),
                                     [&](const char *each) { return word == QLatin1String(each); });
    return known == std::end(pinWords) ? QOfonoSimManager::NoPin
                                       : QOfonoSimManager::PinType(known - std::begin(pinWords));
}

} // namespace

class QOfonoSimManager::Private : public QObject
{
    Q_OBJECT

public:
    struct State {
        bool valid = false;
        bool present = false;
        PinType pinRequired = NoPin;
        QStringList subscriberNumbers;
        QString subscriberIdentity;

        void set(const QString &name, const QVariant &value);
    };

    explicit Private(QOfonoSimManager *simManager)
        : QObject(simManager)
        , q(simManager)
    {
    }

    void follow(const QString &path);

    QOfonoSimManager *const q;
    QString modemPath;
    State state;

private Q_SLOTS:
    void propertyChanged(const QString &name, const QDBusVariant &value);

private:
    void askForProperties();
    void setState(const State &newState);

    std::unique_ptr<ModemInterface> m_sim;
};

void QOfonoSimManager::Private::State::set(const QString &name, const QVariant &value)
{
    if (name == QLatin1String("Present"))
        present = value.toBool();
    else if (name == QLatin1String("PinRequired"))
        pinRequired = pinOf(value.toString());
    else if (name == QLatin1String("SubscriberNumbers"))
        subscriberNumbers = value.toStringList();
    else if (name == QLatin1String("SubscriberIdentity"))
        subscriberIdentity = value.toString();
}

void QOfonoSimManager::Private::follow(const QString &path)
{
    const QPointer<Private> alive(this);
    m_sim.reset();
    modemPath = path;
    setState(State());
    if (!alive || path.isEmpty())
        return;
    m_sim = std::make_unique<ModemInterface>(path, simInterface, ModemInterface::AlwaysListed, nullptr);
    m_sim->object()->follow("PropertyChanged", this, SLOT(propertyChanged(QString, QDBusVariant)));
    connect(m_sim.get(), &ModemInterface::mayHaveCome, this, [this] {
        if (!state.valid)
            askForProperties();
    });
    connect(m_sim.get(), &ModemInterface::hasGone, this, [this] {
        m_sim->object()->forgetCalls();
        setState(State());
    });
    m_sim->start();
}

void QOfonoSimManager::Private::askForProperties()
{
    using Reply = QDBusPendingReply<QVariantMap>;
    // An earlier question was asked of an interface that may not have been there yet.
    m_sim->object()->forgetCalls();
    m_sim->object()->call<Reply>(QLatin1String("GetProperties"), [this](const Reply &reply) {
        if (reply.isError())
            return;
        const QVariantMap properties = reply.value();
        State known;
        for (auto property = properties.begin(); property != properties.end(); ++property)
            known.set(property.key(), property.value());
        known.valid = true;
        setState(known);
    });
}

void QOfonoSimManager::Private::propertyChanged(const QString &name, const QDBusVariant &value)
{
    // What comes before the answer to GetProperties is in that answer.
    if (!state.valid)
        return;
    State changed = state;
    changed.set(name, value.variant());
    setState(changed);
}

void QOfonoSimManager::Private::setState(const State &newState)
{
    State now = newState;
    // The service does not take back what it told of a card that has been pulled.
    if (!now.present) {
        now = State();
        now.valid = newState.valid;
    }
    const State before = std::exchange(state, now);
    // A receiver may delete the sender.
    const QPointer<QOfonoSimManager> alive(q);
    if (now.present != before.present)
        Q_EMIT q->presenceChanged(now.present);
    if (alive && now.pinRequired != before.pinRequired)
        Q_EMIT q->pinRequiredChanged(now.pinRequired);
    if (alive && now.subscriberNumbers != before.subscriberNumbers)
        Q_EMIT q->subscriberNumbersChanged(now.subscriberNumbers);
    if (alive && now.subscriberIdentity != before.subscriberIdentity)
        Q_EMIT q->subscriberIdentityChanged(now.subscriberIdentity);
    if (alive && now.valid != before.valid)
        Q_EMIT q->validChanged(now.valid);
}

QOfonoSimManager::QOfonoSimManager(QObject *parent)
    : QObject(parent)
    , d(new Private(this))
{
}

QOfonoSimManager::~QOfonoSimManager() = default;

QString QOfonoSimManager::modemPath() const
{
    return d->modemPath;
}

void QOfonoSimManager::setModemPath(const QString &path)
{
    if (path != d->modemPath)
        d->follow(path);
}

bool QOfonoSimManager::isValid() const
{
    return d->state.valid;
}

bool QOfonoSimManager::present() const
{
    return d->state.present;
}

QOfonoSimManager::PinType QOfonoSimManager::pinRequired() const
{
    return d->state.pinRequired;
}

QStringList QOfonoSimManager::subscriberNumbers() const
{
    return d->state.subscriberNumbers;
}

QString QOfonoSimManager::subscriberIdentity() const
{
    return d->state.subscriberIdentity;
}

#include "qofonosimmanager.moc"
