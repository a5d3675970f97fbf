// SPDX-License-Identifier: LGPL-2.1-or-later
#ifndef CORVANE_SOFTWAREUPDATER_H
#define CORVANE_SOFTWAREUPDATER_H

#include "reply.h"

#include <corvanemdm/softwareupdate.h>

#include <QtCore/QObject>

#include <chrono>
#include <functional>
#include <optional>

namespace Corvane
{
namespace Agent
{

/**
 * Updates of the operating system, with every step awaited until the phone tells of its end.
 * The time limit is on silence: a phone that reports progress may take as long as it needs.
 */
class SoftwareUpdater : public QObject
{
    Q_OBJECT

public:
    /** What the last check found. */
    struct Offer {
        Reply reply; ///< whether the phone told
        QString version; ///< empty: no update is on offer
    };

    explicit SoftwareUpdater(std::chrono::milliseconds timeout, QObject *parent = nullptr);

    Offer offer() const;

    Reply check();
    Reply download(const QString &version);
    /** Waits until the installation has begun. */
    Reply install();
    /** Waits until nothing is on offer any more, as @p version is in place. */
    Reply waitUntilInstalled(const QString &version);

    /** The library's object, for those that follow its signals. */
    const Mdm::SoftwareUpdate *updates() const;

Q_SIGNALS:
    void downloadProgress(int percent);

private:
    Reply perform(const QString &awaited, void (Mdm::SoftwareUpdate::*completion)(),
                  const std::function<void()> &command);

    Mdm::SoftwareUpdate m_updates;
    std::chrono::milliseconds m_timeout;
    std::optional<QString> m_failure; ///< of what was last asked for: it may come between two waits
};

} // namespace Agent
} // namespace Corvane

#endif // CORVANE_SOFTWAREUPDATER_H
