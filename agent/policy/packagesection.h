// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_PACKAGESECTION_H
#define CORVANE_PACKAGESECTION_H

#include "packagemanager.h"
#include "policysection.h"

#include <QtCore/QMap>

#include <chrono>
#include <memory>

namespace Corvane
{
namespace Agent
{

/** "packages": which packages have to be there, which may not, and which in one version alone. */
class PackageSection : public PolicySection
{
    Q_OBJECT

public:
    explicit PackageSection(std::chrono::milliseconds timeout);

    QString member() const override;
    Service service() const override;
    QString fault(const QJsonObject &wanted) const override;
    QVector<Setting> settings(const QJsonObject &wanted) const override;
    Reply open(const QJsonObject &wanted) override;
    void close() override;
    QVector<Setting> compare(const QJsonObject &wanted) override;
    /** A package may be installed past PackageKit. */
    bool mayHaveDrifted() override { return installed() != m_known; }
    Reply change(const Setting &setting) override;
    QJsonObject exported() override;

    /** @p setting, compared with a phone that has @p version of the package; empty: none. */
    static Setting compared(Setting setting, const QString &version);

private:
    /** Versions by name. */
    using Packages = QMap<QString, QString>;

    Packages installed() const;

    std::chrono::milliseconds m_timeout;
    std::unique_ptr<PackageManager> m_manager;
    Packages m_known; ///< as they were when last looked at
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_PACKAGESECTION_H
