// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_PACKAGEMANAGER_H
#define CORVANE_PACKAGEMANAGER_H

#include "reply.h"

#include <corvanemdm/applications.h>

#include <QtCore/QObject>

#include <chrono>
#include <functional>

namespace Corvane
{
namespace Agent
{

/** Packages, with every request awaited until PackageKit tells of its end. */
class PackageManager : public QObject
{
    Q_OBJECT

public:
    explicit PackageManager(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    /** By name. */
    QList<Mdm::PackageEntry> packages() const;
    /** By name. */
    QList<Mdm::ApplicationEntry> applications() const;

    /** The newest version when @p version is empty. */
    Reply install(const QString &name, const QString &version);
    /** With @p autoremove also what nothing else needs. */
    Reply remove(const QString &name, bool autoremove);

Q_SIGNALS:
    /** PackageKit has come to the end of something: what is installed may have changed. */
    void idle();

private Q_SLOTS:
    void transactionListChanged(const QStringList &transactions);

private:
    Reply perform(const QString &awaited, const std::function<Mdm::ApplicationOperation *()> &request);

    Mdm::Applications m_applications;
    std::chrono::milliseconds m_timeout;
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_PACKAGEMANAGER_H
