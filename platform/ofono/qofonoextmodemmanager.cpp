// SPDX-License-Identifier: LGPL-2.1-or-later
#include <ofono/qofonoextmodemmanager.h>

#include "ofonoobject_p.h"

#include <QtCore/QPointer>
#include <QtDBus/QDBusObjectPath>

#include <utility>

namespace
{

const QLatin1String modemManagerInterface("org.veldmobile.ofono.ModemManager");
constexpr int oldestVersion = 1;

QStringList toStrings(const QList<QDBusObjectPath> &paths)
{
    QStringList strings;
    for (const QDBusObjectPath &path : paths)
        strings.append(path.path());
    return strings;
}

} // namespace

class QOfonoExtModemManager::Private : public QObject
{
    Q_OBJECT

public:
    struct State {
        QStringList availableModems;
        QStringList enabledModems;
        QList<bool> presentSims;
        QString defaultVoiceSim;
        QString defaultDataSim;
        bool serviceReady = false;
        bool complete = false; // everything has been told once

        bool ready() const { return complete && serviceReady; }
    };

    explicit Private(QOfonoExtModemManager *manager);

    QOfonoExtModemManager *const q;
    State state;

private Q_SLOTS:
    void availableModemsChanged(const QList<QDBusObjectPath> &modems);
    void enabledModemsChanged(const QList<QDBusObjectPath> &modems);
    void presentSimsChanged(int index, bool present);
    void defaultVoiceSimChanged(const QString &imsi);
    void defaultDataSimChanged(const QString &imsi);
    void readyChanged(bool ready);

private:
    void askForVersion();
    void askForAll();
    void askForPresentSims();
    template <typename Value, typename Take> void ask(QLatin1String method, Take take);
    template <typename Change> void change(Change change);
    void setState(const State &newState);

    OfonoObject m_object;
    int m_unanswered = 0;
};

QOfonoExtModemManager::Private::Private(QOfonoExtModemManager *manager)
    : QObject(manager)
    , q(manager)
    , m_object(QStringLiteral("/"), modemManagerInterface, this)
{
    m_object.follow("AvailableModemsChanged", this, SLOT(availableModemsChanged(QList<QDBusObjectPath>)));
    m_object.follow("EnabledModemsChanged", this, SLOT(enabledModemsChanged(QList<QDBusObjectPath>)));
    m_object.follow("PresentSimsChanged", this, SLOT(presentSimsChanged(int, bool)));
    m_object.follow("DefaultVoiceSimChanged", this, SLOT(defaultVoiceSimChanged(QString)));
    m_object.follow("DefaultDataSimChanged", this, SLOT(defaultDataSimChanged(QString)));
    m_object.follow("ReadyChanged", this, SLOT(readyChanged(bool)));
    connect(&m_object, &OfonoObject::serviceAppeared, this, &Private::askForVersion);
    connect(&m_object, &OfonoObject::serviceLeft, this, [this] { setState(State()); });
    m_object.start();
}

void QOfonoExtModemManager::Private::askForVersion()
{
    using Reply = QDBusPendingReply<int>;
    m_object.call<Reply>(QLatin1String("GetInterfaceVersion"), [this](const Reply &reply) {
        if (!reply.isError() && reply.value() >= oldestVersion)
            askForAll();
    });
}

void QOfonoExtModemManager::Private::askForAll()
{
    m_unanswered = 6;
    ask<QList<QDBusObjectPath>>(QLatin1String("GetAvailableModems"),
                                [](State &known, const QList<QDBusObjectPath> &modems) {
                                    known.availableModems = toStrings(modems);
                                });
    ask<QList<QDBusObjectPath>>(
        QLatin1String("GetEnabledModems"),
        [](State &known, const QList<QDBusObjectPath> &modems) { known.enabledModems = toStrings(modems); });
    askForPresentSims();
    ask<QString>(QLatin1String("GetDefaultVoiceSim"),
                 [](State &known, const QString &imsi) { known.defaultVoiceSim = imsi; });
    ask<QString>(QLatin1String("GetDefaultDataSim"),
                 [](State &known, const QString &imsi) { known.defaultDataSim = imsi; });
    ask<bool>(QLatin1String("GetReady"), [](State &known, bool ready) { known.serviceReady = ready; });
}

void QOfonoExtModemManager::Private::askForPresentSims()
{
    ask<QList<bool>>(QLatin1String("GetPresentSims"),
                     [](State &known, const QList<bool> &present) { known.presentSims = present; });
}

template <typename Value, typename Take>
void QOfonoExtModemManager::Private::ask(QLatin1String method, Take take)
{
    using Reply = QDBusPendingReply<Value>;
    m_object.call<Reply>(method, [this, take](const Reply &reply) {
        // Without one of the answers the object never is complete.
        if (reply.isError())
            return;
        change([&](State &known) {
            take(known, reply.value());
            known.complete = known.complete || --m_unanswered == 0;
        });
    });
}

template <typename Change> void QOfonoExtModemManager::Private::change(Change change)
{
    State changed = state;
    change(changed);
    setState(changed);
}

void QOfonoExtModemManager::Private::availableModemsChanged(const QList<QDBusObjectPath> &modems)
{
    change([&](State &known) {
        QList<bool> present;
        const QStringList paths = toStrings(modems);
        for (const QString &path : paths)
            present.append(known.presentSims.value(known.availableModems.indexOf(path), false));
        known.availableModems = paths;
        known.presentSims = present;
    });
    // The list has moved under the indices; what is new in it has not been told yet.
    if (state.complete)
        askForPresentSims();
}

void QOfonoExtModemManager::Private::enabledModemsChanged(const QList<QDBusObjectPath> &modems)
{
    change([&](State &known) { known.enabledModems = toStrings(modems); });
}

void QOfonoExtModemManager::Private::presentSimsChanged(int index, bool present)
{
    change([&](State &known) {
        if (index >= 0 && index < known.presentSims.size())
            known.presentSims[index] = present;
    });
}

void QOfonoExtModemManager::Private::defaultVoiceSimChanged(const QString &imsi)
{
    change([&](State &known) { known.defaultVoiceSim = imsi; });
}

void QOfonoExtModemManager::Private::defaultDataSimChanged(const QString &imsi)
{
    change([&](State &known) { known.defaultDataSim = imsi; });
}

void QOfonoExtModemManager::Private::readyChanged(bool ready)
{
    change([&](State &known) { known.serviceReady = ready; });
}

void QOfonoExtModemManager::Private::setState(const State &newState)
{
    const State before = std::exchange(state, newState);
    const State now = state;
    // Who hears that it is not ready any more need not look at the rest; who hears that it is ready finds it.
    const QPointer<QOfonoExtModemManager> alive(q);
    if (before.ready() && !now.ready())
        Q_EMIT q->readyChanged(false);
    if (alive && now.enabledModems != before.enabledModems)
        Q_EMIT q->enabledModemsChanged(now.enabledModems);
    if (alive && now.defaultVoiceSim != before.defaultVoiceSim)
        Q_EMIT q->defaultVoiceSimChanged(now.defaultVoiceSim);
    if (alive && now.defaultDataSim != before.defaultDataSim)
        Q_EMIT q->defaultDataSimChanged(now.defaultDataSim);
    if (alive && !before.ready() && now.ready())
        Q_EMIT q->readyChanged(true);
}

QSharedPointer<QOfonoExtModemManager> QOfonoExtModemManager::instance()
{
    return sharedInThread<QOfonoExtModemManager>([] { return new QOfonoExtModemManager; });
}

QOfonoExtModemManager::QOfonoExtModemManager()
    : d(new Private(this))
{
}

QOfonoExtModemManager::~QOfonoExtModemManager() = default;

bool QOfonoExtModemManager::ready() const
{
    return d->state.ready();
}

QStringList QOfonoExtModemManager::availableModems() const
{
    return d->state.availableModems;
}

QStringList QOfonoExtModemManager::enabledModems() const
{
    return d->state.enabledModems;
}

QList<bool> QOfonoExtModemManager::presentSims() const
{
    return d->state.presentSims;
}

QString QOfonoExtModemManager::defaultVoiceSim() const
{
    return d->state.defaultVoiceSim;
}

QString QOfonoExtModemManager::defaultDataSim() const
{
    return d->state.defaultDataSim;
}

#include "qofonoextmodemmanager.moc"
