// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SOFTWAREUPDATESECTION_H
#define CORVANE_SOFTWAREUPDATESECTION_H

#include "policysection.h"
#include "softwareupdater.h"

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** "softwareUpdate": which update of the operating system to install. */
class SoftwareUpdateSection : public PolicySection
{
    Q_OBJECT

public:
    explicit SoftwareUpdateSection(std::chrono::milliseconds timeout);

    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    Reply refresh() override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

    /** @p setting, compared with a phone that offers the update @p offered; empty: none. */
    static Setting compared(Setting setting, const QString &offered);

private:
    std::chrono::milliseconds m_timeout;
    std::unique_ptr<SoftwareUpdater> m_updater;
    bool m_busy = false; // what the phone announces now is the doing of this object
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SOFTWAREUPDATESECTION_H
