// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_MOBILENETWORKS_H
#define CORVANE_MOBILENETWORKS_H

#include "answer.h"

#include <corvanemdm/connectivitysettings.h>

#include <QtCore/QMap>
#include <QtCore/QObject>
#include <QtCore/QStringList>
#include <QtCore/QVector>

#include <chrono>
#include <functional>
#include <optional>

namespace Corvane
{
namespace Agent
{

using AccessPoint = Mdm::ConnectivitySettings::MobileNetworkAccessPointSettings;
using Technologies = Mdm::ConnectivitySettings::CellularTechnologies;

/** "4g" for it and those before it, and "any" for no restriction. */
QString technologiesName(Technologies technologies);
std::optional<Technologies> technologiesNamed(const QString &name);
QStringList technologiesNames();

/** The modems of the phone, and mobile data through their SIMs. Each question blocks, and may be several. */
class MobileNetworks : public QObject
{
    Q_OBJECT

public:
    struct Modem {
        QString path;
        QString imsi; ///< of its SIM; empty: none that can be used
    };
    using AccessPoints = QMap<AccessPoint::Type, AccessPoint>;

    explicit MobileNetworks(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    Answer<QVector<Modem>> modems() const;

    /** The sets that a modem offers; empty: no choice. */
    Answer<QVector<Technologies>> supported(const QString &modemPath) const;
    Answer<Technologies> selected(const QString &modemPath) const;
    Reply select(const QString &modemPath, Technologies technologies);

    /** Refused unless the SIM is in the phone. */
    Reply ensureSim(const QString &imsi) const;

    /** The SIMs that mobile data can go through. */
    Answer<QStringList> imsis() const;
    Answer<bool> isConnected(const QString &imsi) const;
    /** Done, too, when the phone only has begun to connect; or disconnect. */
    Reply setConnected(const QString &imsi, bool connected);

    // The library makes a SIM the one for mobile data to reach its access points. The one that was is made so
    // again.
    Answer<QMap<QString, AccessPoints>> accessPoints(const QStringList &imsis) const;
    Reply setAccessPoint(const QString &imsi, const AccessPoint &accessPoint);

private:
    QString dataSim() const;

    std::chrono::milliseconds m_timeout;
    Mdm::ConnectivitySettings m_settings;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_MOBILENETWORKS_H
