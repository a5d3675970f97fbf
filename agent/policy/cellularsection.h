// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_CELLULARSECTION_H
#define CORVANE_CELLULARSECTION_H

#include "accesspoint.h"
#include "policysection.h"
#include "simcards.h"

#include <memory>

namespace Corvane
{
namespace Agent
{

/** "cellular": radio technologies, access points and mobile data, by SIM. */
class CellularSection : public PolicySection
{
    Q_OBJECT

public:
    explicit CellularSection(std::chrono::milliseconds timeout);

    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    /** Nobody announces but which SIMs there are. */
    bool mayHaveDrifted() override { return true; }
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

private:
    /** One setting, and where it is on the phone. */
    struct Item {
        enum Kind { RadioTechnologies, AccessPointOfType, Connection };

        Kind kind;
        QString imsi; ///< as the policy names it
        AccessPoint::Type type; ///< of an access point
        QJsonValue wanted; ///< in the policy
        QStringList targets; ///< the SIMs of the phone that it is about

        QString path() const;
    };
    using Networks = QMap<QString, MobileNetworks::AccessPoints>;

    static QVector<Item> itemsOf(const QJsonObject &wanted);
    static Setting settingOf(const Item &item);
    QVector<Item> locate(QVector<Item> items) const;
    Setting compareItem(const Item &item) const;
    Setting compareTechnologies(const Item &item) const;
    Setting compareAccessPoint(const Item &item) const;
    Setting compareConnection(const Item &item) const;
    Answer<AccessPoint> wantedAccessPoint(const Item &item, const QString &imsi) const;
    QString modemOf(const QString &imsi) const;
    Reply changeFor(const Item &item, const QString &imsi);
    Reply learn(const QVector<Item> &items);
    QJsonObject exportedSim(const MobileNetworks::Modem &modem) const;
    void followSims();

    const std::chrono::milliseconds m_timeout;
    std::unique_ptr<MobileNetworks> m_networks;
    std::unique_ptr<SimCards> m_sims; // only while a policy is followed
    QStringList m_knownImsis;
    // As it was when compare() looked.
    QVector<MobileNetworks::Modem> m_modems;
    Answer<Networks> m_accessPoints;
    QMap<QString, Item> m_items; // by path
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_CELLULARSECTION_H
