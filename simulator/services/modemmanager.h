// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SIMULATOR_MODEMMANAGER_H
#define CORVANE_SIMULATOR_MODEMMANAGER_H

#include "busconnection.h"
#include "modem.h"

#include <QtCore/QJsonObject>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <functional>
#include <memory>
#include <vector>

namespace Corvane
{
namespace Simulator
{

class Service;

using ModemList = std::vector<std::unique_ptr<Modem>>;

/** The extension that sees the slots as a whole. What it tells is derived from the modems and the choices. */
class ModemManager
{
public:
    /** @p changed follows what a client has changed. */
    ModemManager(const ModemList &modems, const QJsonObject &profile, std::function<void()> changed);

    // Each is to be followed by announce() and announceDefaults().
    void setReady(bool ready) { m_isReady = ready; }
    void chooseVoiceSim(const QString &imsi) { m_voiceSim = imsi; }
    void chooseDataSim(const QString &imsi) { m_dataSim = imsi; }
    /** Whether the daemon has the extension. */
    void setOffered(bool offered) { m_isOffered = offered; }
    bool isOffered() const { return m_isOffered; }

    void attach(Service &service);
    void detach() { m_service = nullptr; }
    /** Announces what has changed of the modems and of where there are SIMs. */
    void announce();
    /** Announces what has changed of the rest. */
    void announceDefaults();
    QJsonObject describe() const;

private:
    /** What clients can ask for. */
    struct State {
        QStringList available;
        QStringList enabled;
        std::vector<bool> present; ///< by index of the available modems
        QString voiceSim;
        QString dataSim;
        bool ready;
    };

    State state() const;
    /** The SIM that is used when @p chosen is. */
    QString effectiveSim(const QString &chosen) const;
    Modem *modemAt(const QString &path) const;
    void setOnBus();
    void setEnabledModems(MethodCall &call);
    void setDefaultSim(MethodCall &call, QString ModemManager::*choice);
    void emitSignal(const char *member, GVariant *arguments) const;

    const ModemList &m_modems;
    const std::function<void()> m_changed;
    QString m_voiceSim; ///< an IMSI, or empty for any
    QString m_dataSim;
    bool m_isReady = true;
    bool m_isOffered;
    bool m_isOnBus = false;
    State m_told;
    Service *m_service = nullptr;
};

} // namespace Simulator
} // namespace Corvane

#endif // CORVANE_SIMULATOR_MODEMMANAGER_H
